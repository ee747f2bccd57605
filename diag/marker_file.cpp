#include "diag/marker_file.h"

#include "diag/narrow.h"

#include <unistd.h>

static std::wstring debugFilePath;
static bool bDebugFileExists = false;

bool debugFileExists(const std::wstring& dir)
{
    debugFilePath = dir + L"/rcp/prov.debug/debug.txt";
    bDebugFileExists = fileExists(narrowPath(debugFilePath).c_str());
    return bDebugFileExists;
}

bool debugFileWasFound()
{
    return bDebugFileExists;
}

void waitForDeletionOfDebugFile()
{
    if (!bDebugFileExists)
        return;
    const std::string path = narrowPath(debugFilePath);
    while (fileExists(path.c_str()))
        sleep(1);
}
