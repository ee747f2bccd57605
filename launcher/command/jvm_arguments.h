// The words for the JVM: its options, class path and main class.
#ifndef LAUNCHER_COMMAND_JVM_ARGUMENTS_H
#define LAUNCHER_COMMAND_JVM_ARGUMENTS_H

#include "launcher/properties/vmarg_map.h"

#include <string>

/// "-vmargs" (native kind only), the words behind "-vmargs" on the command line, the first
/// "vmfix.noconsole" property (unless "-console" is given without "-restart", or the VM is a
/// library), and the values of the map that are not empty, in key order.
void addVmargsToCommandLine(const std::wstring& workspaceLocation, const PropertyList& props,
                            int argc, wchar_t** argv, bool vmIsLibrary, const VmargMap& vmargs);

/// Each "-X" property, key and value as one word, then the boot class path properties.
void addXargsToCommandLine(const PropertyList& props);

/// "-cp" and the property "cp", if set; in the forced configuration the start-up archive.
void addClasspathToCommandLine(const PropertyList& props);

/// The platform's main class.
void addMainClassToCommandLine();

#endif
