// The platform lock file: which launcher of a workspace is the main process, which a daemon.
//
// The control files lie in the workspace:
//   .rcp.lock   the number of the platform's process in decimal and 10 blanks, or 14 blanks when
//               invalidated; narrow text without a line end, written over from its start
//   .rcp.main   the same number and 4 blanks, written anew by the main process
//   .pipe       the name of the platform's pipe, written by the platform
//   .sid        stands while a platform runs; left over, the last session ended uncleanly
//
// The first launcher holds an exclusive advisory lock (flock, see its man page) on .rcp.lock from
// locateLockFile until its platform has been executed and recorded (a provisioning run: until that
// has ended); later launchers wait for it.
// The role is decided once, in lockLockFile.
#ifndef PLATFORM_LINUX_LOCK_FILE_H
#define PLATFORM_LINUX_LOCK_FILE_H

#include <string>

/// Fixes the paths of the control files, opens the lock file, waits (about 20 seconds at most) for
/// the old platform of a restart to end, takes the lock and decides the role. `exeName` is the
/// name that the platform's process shows in ps. Tracing is forced on meanwhile, so its lines and
/// those of a fatal end always reach the log. Fatal: QVMRL0053E, QVMRL0054E, QVMRL0092E.
void locateLockFile(int argc, wchar_t** argv, const std::wstring& workspace,
                    const std::wstring& exeName);

/// Creates the lock file (mode 0600) if it is missing and opens it for the rest of the process.
/// The platform inherits it, and it alone. Fatal: "QVMRL0054E: Error locating platform lock file".
void createAndOpenLockFile();

/// Waits for the lock, takes it, and decides the role. As main process, removes the marker at
/// `sidPath` and remembers a dirty shutdown if it was there.
/// Fatal: "QVMRL0053E: Error locking platform lock file. ", QVMRL0092E.
void lockLockFile(const std::wstring& sidPath, const std::wstring& exeName);

/// Releases the lock. Fatal: "QVMRL0070E: Error unlocking platform lock file. ".
void unlockLockFile();

/// Writes 14 blanks: no platform. A failure is logged (QVMRL0052E).
void invalidateLockFile();

/// Records the platform's process in .rcp.main and .rcp.lock. Does nothing in a daemon process.
/// Failures are logged (QVMRL0051E, QVMRL00XXI).
void populateLockFile(int childPid);
void populateMainPidFile(unsigned long pid);

/// True when the lock file names a live process that ps shows under a line with `exeName`.
/// Fatal: "QVMRL0092E: Error reading platform lock file." when it does not begin with a number, or
/// cannot be read.
bool isMainProcessRunning(const std::wstring& exeName);

/// The process number that was read last from the lock file; 0 before.
long getPlatformPid();

/// Copies of the paths; empty before locateLockFile.
void getLockFilePath(std::wstring& path);
void getPipeFilePath(std::wstring& path);
void getMainPidFilePath(std::wstring& path);

/// The name of the platform's pipe: the first line of .pipe that is not blank, at most 2024 bytes
/// of it. It is read once. False when there is none.
bool getPipeName(std::wstring& name);

void setMainProcess(bool isMain);
bool isMainProcess();

/// Wait mode is set, never cleared.
void setWaitMode();
bool isWaitMode();

/// True in a main process that found a leftover .sid.
bool isDirtyShutdown();

/// Fixed answers: false, and nothing at all.
bool isPipeDaemonCommand();
void getCmdString();

#endif
