// The clean-up of a shared-classes cache that an unclean end may have damaged.
#ifndef LAUNCHER_USER_AREA_CACHE_MAINTENANCE_H
#define LAUNCHER_USER_AREA_CACHE_MAINTENANCE_H

#include "launcher/properties/vmarg_map.h"

#include <string>

/// After a dirty shutdown, and only when the map holds "vmarg.CacheMaintenance.enable": deletes the
/// cache files that the sub-options "name" and "controlDir" of "vmarg.Dshare" describe, when the
/// control directory's text begins with `workspaceDir`. The name is a part of file names; a lone
/// "*" stands for everything in the directory. `removed` tells whether files were removed without
/// a failure. In every case the start is recorded in the shutdown log. Fatal: the shutdown log's.
void doCacheMaintenance(const std::wstring& workspaceDir, const VmargMap& vmargs,
                        bool dirtyShutdown, bool& removed);

#endif
