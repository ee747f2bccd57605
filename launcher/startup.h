// The start-up sequence: every preparation, in its fixed order.
#ifndef LAUNCHER_STARTUP_H
#define LAUNCHER_STARTUP_H

#include <string>
#include <vector>

/// Prepares the user's area, decides the role, and leaves the command of the platform in
/// `launchArgs`. Runs once per process. Ends the process when a step cannot go on (status 255, the
/// reason in the log) and after a provisioning run (status 0).
void startup(int argc, wchar_t** argv, std::vector<std::wstring>& launchArgs);

#endif
