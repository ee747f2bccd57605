// The diagnostic marker file of an installation: while it is there, starts are traced, and the
// launcher waits for its end.
#ifndef DIAG_MARKER_FILE_H
#define DIAG_MARKER_FILE_H

#include <string>

/// Looks for "<dir>/rcp/prov.debug/debug.txt", remembers whether it was there, and says so.
bool debugFileExists(const std::wstring& dir);

/// What the last debugFileExists of this run found; false when there was none.
bool debugFileWasFound();

/// When the marker file was found: sleeps, a second at a time, until it is gone. Without a limit.
void waitForDeletionOfDebugFile();

#endif
