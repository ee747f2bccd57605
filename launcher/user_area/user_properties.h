// The user's copies of config.ini and rcpinstall.properties, made once and never refreshed.
//
// The user's rcpinstall.properties holds the lines of the installation's file that belong to this
// system, and a block of values that this installation was started with: "rcp.install.id", "vm"
// (from "jvm.location", when it is not empty), "rcp.base.location", "install.configuration",
// "com.vantor.rcp.core.locale" and "com.vantor.rcp.core.bidi", in this order.
#ifndef LAUNCHER_USER_AREA_USER_PROPERTIES_H
#define LAUNCHER_USER_AREA_USER_PROPERTIES_H

#include "launcher/properties/property_list.h"

#include <string>

/// Copies the installation's config.ini to `configDir`, unless the user's exists, and marks the
/// first launch. Fatal: as copyFile; QVMRL0009E.
void createConfigIni(const std::wstring& configDir, const std::wstring& baseLocation);

/// Makes the user's rcpinstall.properties unless it exists, and marks the first launch. Returns
/// its path. `props` is a borrowed copy. Fatal: as copyFile; QVMRL0022E, QVMRL0008E.
std::wstring createRCPInstallProps(const std::wstring& workspaceDir, const std::wstring& configDir,
                                   const std::wstring& baseLocation, const std::wstring& rcpHome,
                                   PropertyList props);

/// Writes to `newPath` the lines of `userPath` that belong to this system, and the block. Returns
/// 0, or -1 when one of the files cannot be opened (logged, QVMRL0074E). A failed write is logged
/// (QVMRL0001E, QVMRL0015E). `workspaceDir` and `rcpHome` have no influence on what is written.
/// Fatal, with the line copy left in `newPath`: QVMRL0008E when "rcp.install.id",
/// "rcp.base.location" or "install.configuration" is missing.
int fixUserRCPInstallProperties(const std::wstring& workspaceDir, std::wstring& userPath,
                                std::wstring& newPath, const std::wstring& rcpHome,
                                const PropertyList& props);

#endif
