// Threads that were left behind because what they called did not come back. Such a thread owns all that it touches, but
// the libraries' and the run-time library's own state, and their locks, are everybody's: a process that has one must
// not be taken apart around it. Whoever leaves a thread behind says so here; the entry point ends the process by it.
#pragma once

// From any thread, once for each thread that is left behind.
void NoteAbandonedThread();

// Whether any thread of this process was left behind, though it may have come back since.
bool HasAbandonedThreads();

// Ends the process with `code` at once when a thread was left behind: no static object is destroyed, no library told
// and no lock waited for, so what is to be kept (files, the log) has to be closed before. Returns `code` otherwise.
int EndingCode(int code);
