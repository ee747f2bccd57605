// The platform's native executable and the words that only it understands.
#ifndef LAUNCHER_COMMAND_PLATFORM_EXECUTABLE_H
#define LAUNCHER_COMMAND_PLATFORM_EXECUTABLE_H

#include "launcher/properties/property_list.h"

#include <string>

/// Sets `name` to the property "eclipse.name", or to "eclipse".
void getEclipseExeName(std::wstring& name, const PropertyList& props);

/// Begins the command with "<rcp.base.location>/linux/x86/<name>".
/// Fatal: QVMRL0011E (no base location), "QVMRL0007E: %ls is not executable or does not exist.".
void addBaseEclipseToCommandLine(const PropertyList& props, const PropertyList& launcherProps);

/// "-startup" and the launcher archive: that behind "-perfJar", or the base location's.
/// `props` is a borrowed copy.
void addStartupToCommandLine(PropertyList props, int argc, wchar_t** argv);

/// "-useDaemon" and the number of the running platform, in a daemon process only.
void addUseDaemonToCommandLine();

#endif
