// Where the launcher works: the installation, the workspace, the configuration location.
//
// The functions compute paths and create nothing. What they give depends on the install
// configuration, which is chosen before any of them is asked. Paths are given as configured: a
// user's backslashes are converted where a path is used.
#ifndef LAUNCHER_USER_AREA_LOCATIONS_H
#define LAUNCHER_USER_AREA_LOCATIONS_H

#include "launcher/properties/property_list.h"
#include "platform/linux/argument_vector.h"

#include <string>

/// The directory of the running executable as a new string that the caller owns, or null when it
/// is no directory. The arguments are not used. Fatal: QVMRL0184E.
wchar_t* getRCPDirectory(int argc, wchar_t** argv);

/// Sets `out` to the rcp home, the parent of the executable's directory when that is named "rcp";
/// otherwise to nothing, without a message.
/// Fatal: "QVMRL0049E: Unable to locate the platform's installation directory".
void getInstallDir(std::wstring& out, int argc, wchar_t** argv);

/// Sets `nearDir` to the second and `farDir` to the sixth ancestor of the executable's directory.
/// Fatal: "QVMRL0048E: Unable to locate the directory containing %ls" when there are not so many.
void getServiceInstallDir(std::wstring& nearDir, std::wstring& farDir, int argc, wchar_t** argv);

/// Sets `out` to the workspace: by configuration, by "-data", by "rcp.data", or the default
/// $HOME/VANTOR/RCP/<install id>/<user name>. Returns 0 for the default, 1 otherwise.
/// Fatal: QVMRL0099E (rcp.data), QVMRL0035E (no install id), QVMRL0037E (no USER).
int getWorkspaceLocation(std::wstring& out, const PropertyList& props, int argc, wchar_t** argv,
                         const std::wstring& rcpHome);

/// Sets `out` to the configuration location: ".config" in the workspace, or the service one beside
/// it. Result and fatal ends as getWorkspaceLocation.
int getConfigurationLocation(std::wstring& out, const PropertyList& props, int argc, wchar_t** argv,
                             const std::wstring& rcpHome);

/// Makes the first "-data" of `args` the value of "rcp.data" in `props`, if both are there. The
/// old value is freed. The walk looks at keys and values alike.
void patchWorkspace(const ArgumentVector& args, PropertyList& props);

/// Replaces the first "${rcp.home}" of `s`; later ones stay.
void replaceFirstRcpHome(std::wstring& s, const std::wstring& rcpHome);

#endif
