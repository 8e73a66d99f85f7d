#ifndef QN_MEDIA_AUDIO_CONVERTER_H
#define QN_MEDIA_AUDIO_CONVERTER_H

#include <effectchain/QNAudioFormatConverter.h>
#include <utils/RefBase.h>

namespace android {
namespace qnmediaeditor {

// A reference-counted handle on the device's PCM format converter.
// in1/out1 are sample rates and in2/out2 channel counts; bits are per sample.
class QNMediaAudioConverter : public RefBase {
public:
    QNMediaAudioConverter();
    virtual ~QNMediaAudioConverter();

    bool isValid();
    int getAudioFormat(int bitsPerSample);
    bool init(int in1, int in2, int inBits, int out1, int out2, int outBits);
    // The converter's answer: the number of output bytes.
    int process(unsigned char* in, unsigned char* out, int size);
    // A buffer for the output of `size` input bytes; release it with freeBuff.
    unsigned char* allocateBuff(unsigned char* buffer, int size, float value);
    void freeBuff(unsigned char* buffer);

private:
    QNAudioFormatConverter* mConverter;

    QNMediaAudioConverter(const QNMediaAudioConverter&) = delete;
    QNMediaAudioConverter& operator=(const QNMediaAudioConverter&) = delete;
};

// The sample-format code of the audio engines for a bit depth (16-bit for any other).
int audioFormatCodeOf(int bitsPerSample);

}  // namespace qnmediaeditor
}  // namespace android

#endif
