// Where the JVM's own properties file, jvm.properties, lies.
//
// The VM path is the path of the JVM's executable (or library) as given by "-vm" or by the
// property "vm". The JVM property root is a directory, with a "/" at its end.
#ifndef LAUNCHER_COMMAND_JVM_LOCATION_H
#define LAUNCHER_COMMAND_JVM_LOCATION_H

#include "launcher/properties/property_list.h"

#include <string>

/// Sets `jvmPropertiesPath` to the file to load, which need not exist, `vmPath` to the VM path
/// (with slashes; empty when none is given), `notPluginJvm` to false only for a JVM inside a
/// platform plug-in, and appends the property "jvm.root" to the list. Always returns true. Always
/// logs QVMRL0021I or QVMRL0119I. Fatal: "QVMRL0079E: -vm on command line must be followed by a
/// valid jvm path."
bool getJvmPropertyLocation(PropertyList& props, int argc, wchar_t** argv,
                            const std::wstring& rcpHome, std::wstring& jvmPropertiesPath,
                            bool& notPluginJvm, std::wstring& vmPath);

/// The plug-in's own directory, for a VM below "/eclipse/plugins/". True, with `root` set and
/// `notPluginJvm` false, when jvm.properties stands there; otherwise `notPluginJvm` is true.
bool getStandardJvmPropertyRoot(const std::wstring& vmPath, std::wstring& root, bool& notPluginJvm);

/// The directory two, three or four levels above the VM; the first that holds jvm.properties.
bool getInstallJvmPropertyRoot(const std::wstring& vmPath, std::wstring& root);

/// True when `root` followed by "jvm.properties" exists: it can be opened for reading, as a
/// directory can.
bool jvmPropExists(const std::wstring& root);

/// Sets `javaHome` to what stands before the first "jvm/bin" of the VM path, less one character
/// (normally the "/"), and to nothing when nothing stands there; to `fallback` when the path holds
/// none.
void getJvmHome(const std::wstring& vmPath, std::wstring& javaHome, const std::wstring& fallback);

#endif
