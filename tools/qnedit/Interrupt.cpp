#include "Interrupt.h"

#include <atomic>
#include <csignal>
#include <cstring>
#include <unistd.h>

#include "Cli.h"

namespace qnedit {

namespace {

std::atomic<int> gSignal{0};
// Written before the handlers can see it and read only from them; a fixed
// buffer because the handler may not allocate.
char gCleanupPath[4096];
std::atomic<bool> gHaveCleanupPath{false};

void onSignal(int sig) {
    int expected = 0;
    if (gSignal.compare_exchange_strong(expected, sig)) return;
    if (gHaveCleanupPath.load()) unlink(gCleanupPath);
    _exit(128 + sig);
}

}  // namespace

void catchInterrupts() {
    static bool installed = false;
    if (installed) return;
    installed = true;
    struct sigaction action;
    memset(&action, 0, sizeof(action));
    action.sa_handler = onSignal;
    sigemptyset(&action.sa_mask);
    // Restarted calls: a signal must not surface as a spurious read or write error.
    action.sa_flags = SA_RESTART;
    for (int sig : {SIGINT, SIGTERM, SIGHUP}) {
        // A signal ignored by whoever started us (nohup, a background job) stays ignored.
        struct sigaction old;
        if (sigaction(sig, nullptr, &old) == 0 && old.sa_handler == SIG_IGN) continue;
        sigaction(sig, &action, nullptr);
    }
}

bool interrupted() { return gSignal.load() != 0; }

void checkInterrupted() {
    const int sig = gSignal.load();
    if (sig == 0) return;
    throw ToolError(128 + sig, std::string("interrupted by ") + (sig == SIGINT ? "SIGINT" : sig == SIGTERM ? "SIGTERM" : "SIGHUP") +
                                   ", nothing written");
}

void setInterruptCleanupPath(const char* path) {
    gHaveCleanupPath.store(false);
    if (path == nullptr || strlen(path) >= sizeof(gCleanupPath)) return;
    strcpy(gCleanupPath, path);
    gHaveCleanupPath.store(true);
}

}  // namespace qnedit
