// What stands in the platform lock file, as its description in lock_file.h has it.
//
// Read and written at the start of the file, past any stream: a stream keeps its buffer across a
// seek, and each look must see the file as it is now, or a restart would wait for the old number
// for ever. The position of the descriptor, which the platform shares, stays where it is.
#ifndef PLATFORM_LINUX_LOCK_CONTENT_H
#define PLATFORM_LINUX_LOCK_CONTENT_H

#include <string>

enum LockContent { PLATFORM_NUMBER, NO_DATA, UNREADABLE };

/// Sets `pid` to the number at the start of the file, with white space before it or not: as fscanf
/// would with "%ld", one that is too large as the largest. NO_DATA when the file ends before
/// anything else. UNREADABLE when anything else comes first, or with the reason in errno when
/// nothing can be read.
LockContent readLockContent(int fd, long& pid);

/// Writes `text` over the start of the file, at once: later the lock is somebody else's. False when
/// not all of it got there.
bool writeLockContent(int fd, const std::string& text);

#endif
