// qnedit: the media editor's command line. Each subcommand drives the
// library the way the editor service does.

#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include <log/log.h>

#include "Cli.h"
#include "Commands.h"

using namespace qnedit;

namespace {

const Command kCommands[] = {
    {"probe", "show a file's container, tracks and device items", kProbeHelp, runProbe},
    {"trim", "cut a file losslessly", kTrimHelp, runTrim},
    {"waveform", "show, save or draw a recording's waveform", kWaveformHelp, runWaveform},
    {"mix", "mix background audio into a recording", kMixHelp, runMix},
    {"frame", "save a video's picture, a strip of them, or a raw frame as PNG", kFrameHelp, runFrame},
};

void printUsage(FILE* out) {
    fprintf(out,
            "usage: qnedit [--quiet] [--verbose] COMMAND [ARGS]\n"
            "\n"
            "Commands:\n");
    for (const Command& c : kCommands) fprintf(out, "  %-9s %s\n", c.name, c.summary);
    fprintf(out,
            "\n"
            "Options for every command:\n"
            "  --quiet    no progress bar\n"
            "  --verbose  print the library's debug log on stderr\n"
            "  --help     this text, or a command's own with 'qnedit COMMAND --help'\n"
            "\n"
            "Exit status: 0 success, 1 bad input or failed operation, 2 bad usage.\n");
}

}  // namespace

int main(int argc, char** argv) {
    std::vector<std::string> words;
    const Command* command = nullptr;
    bool help = false;
    for (int i = 1; i < argc; ++i) {
        const std::string w = argv[i];
        if (w == "--quiet" || w == "-q") {
            gCommon.quiet = true;
        } else if (w == "--verbose" || w == "-v") {
            gCommon.verbose = true;
        } else if (w == "--help" || w == "-h") {
            help = true;
        } else if (command == nullptr && !w.empty() && w[0] != '-') {
            for (const Command& c : kCommands) {
                if (w == c.name) command = &c;
            }
            if (command == nullptr) {
                fprintf(stderr, "qnedit: unknown command '%s' (see qnedit --help)\n", w.c_str());
                return kExitUsage;
            }
        } else {
            words.push_back(w);
        }
    }
    if (help) {
        if (command != nullptr) {
            fputs(command->help, stdout);
        } else {
            printUsage(stdout);
        }
        return kExitOk;
    }
    if (command == nullptr) {
        printUsage(stderr);
        return kExitUsage;
    }
    android::setLogThreshold(gCommon.verbose ? ANDROID_LOG_VERBOSE : ANDROID_LOG_SILENT);
    try {
        return command->run(words);
    } catch (const ToolError& e) {
        fprintf(stderr, "qnedit %s: %s\n", command->name, e.what());
        return e.code;
    } catch (const std::exception& e) {
        fprintf(stderr, "qnedit %s: %s\n", command->name, e.what());
        return kExitBadInput;
    }
}
