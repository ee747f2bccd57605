// Whether a part of the user's area had to be made on this start.
#ifndef LAUNCHER_USER_AREA_FIRST_LAUNCH_H
#define LAUNCHER_USER_AREA_FIRST_LAUNCH_H

#include <string>

/// True once a directory or file of the user's area had to be made, or a new provisioning level
/// was seen. Written, only ever to true, by makeUserDirectory, createConfigIni,
/// createRCPInstallProps, createPlatformXML and checkForProvisioning.
extern bool userFirstLaunch;

/// Makes `dir` unless it is a directory; making it marks the first launch. When it cannot be made
/// the process ends with `message`, which holds one %ls for the directory, shown with slashes.
void makeUserDirectory(const std::wstring& dir, const char* message);

#endif
