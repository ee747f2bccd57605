// An old user area in a new start: the configuration directory is put aside, the workspace stays.
//
// With WS the workspace, CFG the configuration location and UPD its "org.eclipse.update":
//   CFG + "bak"              the configuration as it was (".configbak" beside ".config")
//   UPD/registry, UPD/bookmarks.xml   carried over, by way of WS/registry.old, WS/bookmarks.xml.old
//   WS/platform.xml.old      a record; it stays there
//   WS/<name>.old.part       a copy that a kill cut short; the next copy of that file clears it
//   <path> + "deleteme0001" to "deleteme0005"   where a directory in the way is moved before it is
//                            removed; what an interrupted run leaves there is cleared by the next
// Fatal lines of this page end with the system's reason.
#ifndef LAUNCHER_USER_AREA_WORKSPACE_RESET_H
#define LAUNCHER_USER_AREA_WORKSPACE_RESET_H

#include <string>

/// Copies, or with `move` moves, srcDir/srcName to dstDir/dstName; an empty name means the
/// directory itself. What stands at the destination is cleared away first. False when the source
/// does not exist and need not (traced, QVMRL0110I). Fatal: QVMRL0109E (the source must exist),
/// QVMRL0111E, QVMRL0112E (the destination cannot be cleared), QVMRL0113E, QVMRL0141E, copyFile's.
bool handleCopy(const std::wstring& dstDir, const std::wstring& dstName, const std::wstring& srcDir,
                const std::wstring& srcName, bool mustExist, bool move);

/// handleCopy that moves.
bool handleFileMove(const std::wstring& dstDir, const std::wstring& dstName,
                    const std::wstring& srcDir, const std::wstring& srcName, bool mustExist);
bool handleDirMove(const std::wstring& dst, const std::wstring& src, bool mustExist);

/// The user's area was made by another installation: saves what is carried over, puts the
/// configuration aside, and begins a new one. Fatal: handleCopy's, QVMRL0044E.
void createReusableWorkspace(const std::wstring& workspaceDir, const std::wstring& configDir);

/// A reset was asked for: the same, with the plug-in state named by the "resetDir." properties
/// deleted as well. Fatal: handleCopy's, resetMetaDataDirs', QVMRL0045E.
void resetWorkspace(const std::wstring& workspaceDir, const std::wstring& configDir,
                    const std::wstring& baseLocation);

/// Deletes the directories below WS/.metadata/.plugins/ that the "resetDir." properties of the
/// user's rcpinstall.properties (or else the installation's) name; an empty value is passed over, a
/// value is not checked for "..". Fatal: QVMRL0106E (neither file), QVMRL0107E with the list of
/// what could not be removed.
void resetMetaDataDirs(const std::wstring& workspaceDir, const std::wstring& configDir,
                       const std::wstring& baseLocation);

#endif
