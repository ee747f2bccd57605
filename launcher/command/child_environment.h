// What the platform inherits besides its words. These change the launcher's own environment, from
// properties, just before the platform is started. A call that fails is not reported.
#ifndef LAUNCHER_COMMAND_CHILD_ENVIRONMENT_H
#define LAUNCHER_COMMAND_CHILD_ENVIRONMENT_H

#include "launcher/properties/property_list.h"

#include <string>

/// LD_LIBRARY_PATH becomes "library.path.prepend", the library path that the launcher was recorded
/// with, and "library.path.append", those that are not empty with ":" between them. Nothing
/// happens without the first or the last.
void addLibpathToCommandLine(const PropertyList& props);

/// Removes the variables that "env.unset<one character><name>" properties name, then sets those
/// that "env.set<one character><name>" properties name to their values.
void addEnvSetToCommandLine(const PropertyList& props);

/// Preloads "library.preload". Fatal: "QVMRL0034E: Couldn't find the rcp.install.id property!",
/// setPreload's.
void addLdPreloadToCommandLine(const PropertyList& props);

/// JAVA_HIGH_ZIPFDS becomes "env.JAVA_HIGH_ZIPFDS", or 500.
void addEnvJavaHighZipfds(const PropertyList& props);

/// LD_PRELOAD becomes `preloadPath`. It cannot hold a blank, so a path with one is reached through
/// the link "/tmp/vantor.rcp.<user>.<install id>.<library name>", which is made, or replaced when
/// it leads elsewhere; a library with a blank that does not exist sets nothing, one without is not
/// looked at. A link that cannot be made or replaced is named all the same. Traces every step.
/// Fatal: QVMRL0189E (neither "/" nor "\" in the path), "QVMRL0006E: Couldn't find the user name!",
/// QVMRL0184E.
void setPreload(const std::wstring& preloadPath, const std::wstring& installId);

#endif
