// A short history of the platform's starts: "shutdown.log" in the log directory, a line
// "Started <local time>" for each, cut back to its last 101 lines when it has 200 or more.
#ifndef PLATFORM_LINUX_SHUTDOWN_LOG_H
#define PLATFORM_LINUX_SHUTDOWN_LOG_H

#include <string>

/// Records this start in the history of `workspace`, then cuts the history back.
/// Fatal: as updateShutdownLog.
void doShutdownLogUpdate(const std::wstring& workspace);

/// Appends the line of this start. Fatal: "QVMRL0098E: Could not open %ls for writing!",
/// "QVMRL0118E: Error writing to %ls file.".
void updateShutdownLog(const std::wstring& logDir);

/// Cuts the history when it has 200 lines or more; a line of more than 2024 bytes counts as
/// several. A failure is logged (QVMRL0138E, QVMRL0105E, QVMRL0137E) and leaves it as it was.
void truncateShutdownLog(const std::wstring& logDir);

#endif
