// The stream of a log file.
#ifndef DIAG_LOG_STREAM_H
#define DIAG_LOG_STREAM_H

#include <cstdio>

enum LogPlace { OWN_LOG, LOG_FOR_EVERYBODY };

/// A new log at `path`, for narrow text; null with the reason in errno when it cannot be opened.
/// Where everybody may write somebody may have put a FIFO: what that does not take is lost, and
/// nobody waits. At most one is open in a process, until that ends.
FILE* openLogStream(const char* path, LogPlace place);

#endif
