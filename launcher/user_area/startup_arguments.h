// "args.properties" in the configuration location: the words of this start, from which the
// platform restarts the launcher. In the format of Java's properties: arg0, arg1, ... argc, and
// the library path that this process was started with.
#ifndef LAUNCHER_USER_AREA_STARTUP_ARGUMENTS_H
#define LAUNCHER_USER_AREA_STARTUP_ARGUMENTS_H

#include "launcher/properties/property_list.h"

#include <string>

/// Writes the file anew. "-restart" and "-resetconfig" (the first of each) are left out, and
/// "-rcp_old_pid" with its value; arg0 is `restartExe`, or the launcher's own path when that is
/// null or empty; the word behind the first "-data" is recorded with its placeholders resolved.
/// Fatal: "QVMRL0097E: Could not open %ls for writing!", QVMRL0020E, QVMRL0116E, QVMRL0117E
/// (a failed write); what was written stays.
void writeStartupArgs(int argc, wchar_t** argv, const std::wstring& configDir,
                      const wchar_t* restartExe, const PropertyList& props,
                      const std::wstring& rcpHome);

#endif
