#ifndef QNEDIT_INTERRUPT_H
#define QNEDIT_INTERRUPT_H

namespace qnedit {

// SIGINT, SIGTERM and SIGHUP while an output is being written: the handler
// only notes the signal; the copy loops call checkInterrupted(), which ends
// the command so the unfinished output is removed on the way out. A second
// signal while the first is still pending removes the temporary file from the
// handler and exits at once, for a run stuck in a blocking call.
void catchInterrupts();
// Throws a ToolError with status 128 + the signal (130 for SIGINT, 143 for
// SIGTERM) once one has arrived.
void checkInterrupted();
bool interrupted();
// The one temporary file the handler may remove; null for none.
void setInterruptCleanupPath(const char* path);

}  // namespace qnedit

#endif
