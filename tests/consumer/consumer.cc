#include <cstdio>

#include <QNMediaEditorDefs.h>
#include <QNMediaEditorUtils.h>

using android::qnmediaeditor::QNMediaEditorUtils;

int main() {
    unsigned int words[2] = {0x12345678, 0x80000000};
    uint8_t* out = reinterpret_cast<uint8_t*>(words);
    QNMediaEditorUtils::ConvertXto24packed(words, out, 2, false);
    const bool packed = out[0] == 0x56 && out[2] == 0x12 && out[5] == 0x80;
    const bool loaded = android::qnmediaeditor::MEDIAEDITOR_MIMETYPE_FLAC_QNSW != nullptr;
    printf("packed %d, initialised %d\n", packed, loaded);
    return packed && loaded ? 0 : 1;
}
