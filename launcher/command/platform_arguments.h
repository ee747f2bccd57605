// The words that the platform itself reads, and the system properties that tell it where it is.
#ifndef LAUNCHER_COMMAND_PLATFORM_ARGUMENTS_H
#define LAUNCHER_COMMAND_PLATFORM_ARGUMENTS_H

#include "launcher/properties/property_list.h"

#include <string>

/// The user's platform words, the workspace and configuration, and the defaults of application,
/// customisation, product and personality that the user did not give.
/// Fatal: "QVMRL0005E: Couldn't find the rcp.install.id property!"; the locations' ends.
void addMainOptionsToCommandLine(const PropertyList& props, const PropertyList& launcherProps,
                                 int argc, wchar_t** argv, const std::wstring& rcpHome);

/// The "-D" words. Traces QVMRL0075I for each that a property gives.
/// Fatal: "QVMRL0036E: Couldn't find the rcp.install.id property!", QVMRL0025E (the install
/// configuration has no name); the locations' ends.
void addDashDToCommandLine(const PropertyList& props, const PropertyList& launcherProps, int argc,
                           wchar_t** argv, const std::wstring& rcpHome);

#endif
