// Placeholders in values and words.
//
//   ${rcp.home}                            the installation
//   ${workspace.location}, ${rcp.data}     the user's workspace
//   ${prop.<key>}                          the value of another property
//   ${env.<name>}, ${env.<name>,<default>} the value of an environment variable
//
// The first two lines are the standard placeholders, the others the user placeholders. A
// placeholder ends at the first "}" behind its "${"; they do not nest, but what a value brings in
// is resolved again.
#ifndef LAUNCHER_PROPERTIES_PLACEHOLDERS_H
#define LAUNCHER_PROPERTIES_PLACEHOLDERS_H

#include "launcher/properties/property_list.h"
#include "launcher/properties/vmarg_map.h"

#include <string>

/// Replaces the standard placeholders, in the order above. True when there was one.
/// Fatal: QVMRL0088E for a value that contains the very placeholder that it replaces, or that
/// completes one with what it meets, for ever.
bool replaceStdPlaceholders(const std::wstring& workspace, const std::wstring& rcpHome,
                            std::wstring& s);

/// The start of the last placeholder that begins at or before `pos`, npos when there is none.
/// `length` is its length, `name` what stands between its brackets; one that is not closed at or
/// before `pos` ends at `pos` and loses the last character of its name.
std::wstring::size_type findLastPlaceholder(const std::wstring& s, std::wstring::size_type pos,
                                            std::wstring::size_type& length, std::wstring& name);

/// Sets `value` to what stands for the user placeholder `name`; when nothing does, to the
/// placeholder itself, and the result is false.
bool getPlaceholderValue(const std::wstring& name, std::wstring& value, const PropertyList& props);

/// Resolves the user placeholders of `s` from its end to its start. False when one could not be
/// resolved, one brought itself in again ten times in a row, or values brought in more and more
/// without an end; `s` then shows how far it came.
/// Traces QVMRL0071I for each.
bool replaceUserPlaceholders(std::wstring& s, const PropertyList& props);

/// Both kinds. True when anything changed. Fatal: "QVMRL0088E: property substitution is invalid
/// (%ls)" with the partly resolved text.
bool replaceAllPlaceholders(const std::wstring& workspace, const std::wstring& rcpHome,
                            std::wstring& s, const PropertyList& props);

/// Both kinds in every value of the map, in key order. Nothing happens while `props` is empty.
/// Fatal: QVMRL0088E.
void replacePlaceholdersInVmargMap(std::wstring workspace, std::wstring rcpHome,
                                   const PropertyList& props, VmargMap& map);

/// Both kinds in every value of the list, in order; a later value sees the earlier ones resolved.
/// A changed value is replaced by a new block. Fatal: QVMRL0088E.
void replacePlaceholdersInRcpInstallProp(std::wstring workspace, std::wstring rcpHome,
                                         PropertyList& props);

/// The standard placeholders in `argc` words. A word that changed becomes a new string, which the
/// caller owns, in its slot of `argv` and in the same slot of `changed`; for the others that slot
/// becomes an empty text that nobody frees.
void replacePlaceholdersInArgv(std::wstring workspace, std::wstring rcpHome, wchar_t*** argv,
                               wchar_t*** changed, int argc);

/// Puts "${prop.java.home}/" in front of the entries of a list with ":" between them, unless they
/// hold that placeholder. Entries of one character are dropped.
void fixUpJvmLibPath(std::wstring& path);

#endif
