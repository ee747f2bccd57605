// JVM arguments by name: "vmarg.<name>" and the whole argument. The first source that names one
// wins: the command line, a configuration extension, the user's install properties, jvm.properties.
#ifndef LAUNCHER_PROPERTIES_VMARG_MAP_H
#define LAUNCHER_PROPERTIES_VMARG_MAP_H

#include "launcher/properties/property_list.h"
#include "platform/linux/argument_vector.h"

#include <map>
#include <string>

/// Key (with its "vmarg." in front) to argument, in the order in which the JVM gets them. An empty
/// argument emits nothing, and keeps later sources from naming one.
typedef std::map<std::wstring, std::wstring> VmargMap;

/// Moves every entry whose key begins with "vmarg." from the list into the map, and frees it; one
/// whose key the map has is dropped.
void insertPropToVmargMap(VmargMap& map, PropertyList& list);

/// Takes every word of argv that begins with "vmarg." into the map and sets `outArgs` to the
/// others. Fatal for such a word without "=": "QVMRL0033E: velmora invoked with an invalid vmarg."
void insertArgsToVmargMap(VmargMap& map, int argc, wchar_t** argv, ArgumentVector& outArgs);

/// The same on one vector, in place. Fatal: "QVMRL0128E: velmora invoked with an invalid vmarg."
void insertCargsToVmargMap(VmargMap& map, ArgumentVector& args);

#endif
