#ifndef QNEDIT_COMMANDS_H
#define QNEDIT_COMMANDS_H

#include <string>
#include <vector>

namespace qnedit {

struct Command {
    const char* name;
    const char* summary;
    const char* help;  // full usage text
    int (*run)(const std::vector<std::string>& words);
};

int runProbe(const std::vector<std::string>& words);
int runTrim(const std::vector<std::string>& words);
int runWaveform(const std::vector<std::string>& words);
int runMix(const std::vector<std::string>& words);
int runFrame(const std::vector<std::string>& words);

extern const char* const kProbeHelp;
extern const char* const kTrimHelp;
extern const char* const kWaveformHelp;
extern const char* const kMixHelp;
extern const char* const kFrameHelp;

}  // namespace qnedit

#endif
