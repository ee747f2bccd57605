// Which kind of installation this is: the install configuration, the install id, and the files of
// the installation that may have a variant for the configuration.
#ifndef LAUNCHER_USER_AREA_INSTALLATION_H
#define LAUNCHER_USER_AREA_INSTALLATION_H

#include "launcher/properties/property_list.h"

#include <string>

enum InstallConfiguration {
    CONFIG_SERVICE = 1,          // "service"
    CONFIG_LOCKDOWN = 2,         // "lockdown"
    CONFIG_USER = 3,             // "user", and a missing "install.configuration"
    CONFIG_SERIAL_MULTIUSER = 4, // "serial.multiuser"
    CONFIG_OTHER = 5,            // any other word
    CONFIG_MULTIUSER = 6,        // "multiuser"
    CONFIG_MU_SERVICE = 7,       // forced by the caller of SetInstallConfiguration
    CONFIG_USERPB = 8            // "userpb"
};

/// The configuration in force, an InstallConfiguration, CONFIG_OTHER before it is chosen, and
/// whether the property said "lockdown". Written by SetInstallConfiguration, once.
extern int eConfig;
extern bool IS_LOCKDOWN;

/// Chooses the configuration from "install.configuration", compared exactly. Returns 1. A missing
/// one is traced (QVMRL0041I). `muService` forces CONFIG_MU_SERVICE; "lockdown" still counts.
int SetInstallConfiguration(const PropertyList& props, bool muService);

/// True for an installation whose property says "lockdown".
bool isLockdownConfig();

/// True for the two configurations whose command starts the JVM itself: "service" and the forced.
bool startsJvmDirectly();

/// The install id: a text of `props`. In the "userpb" configuration a missing one is made up from
/// the time and appended to `props` and to the file `installPropsPath`. Fatal: QVMRL0016E (it is
/// missing in another configuration), QVMRL0017E, QVMRL0018E (it cannot be appended).
const wchar_t* getInstallID(const std::wstring& installPropsPath, PropertyList& props);

/// True when the user's rcpinstall.properties in `configDir` holds an install id that differs from
/// `installId`; a missing file or id is not old. What the file holds is added to `userProps`, which
/// is to be empty.
bool isOldRcpInstallId(const std::wstring& installId, const std::wstring& configDir,
                       PropertyList& userProps);

/// The path of an installation's file: "<base>/config/<variant>/<fileName>" when that exists, else
/// "<base>/<fileName>". The variant is "muservice", "user", "pbuilder" or empty.
std::wstring getCoreFileLocation(const std::wstring& base, const wchar_t* fileName);

#endif
