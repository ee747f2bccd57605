#include "launcher/user_area/first_launch.h"

#include "diag/SvcDebug_linux.h"
#include "platform/linux/directories.h"
#include "platform/linux/files.h"
#include "platform/linux/paths.h"

bool userFirstLaunch = false;

void makeUserDirectory(const std::wstring& dir, const char* message)
{
    std::wstring path = dir;
    convertToOsSeparator(path);
    if (isDirectory(path.c_str()))
        return;
    userFirstLaunch = true;
    if (!ensureDirectory(path.c_str()))
        fatalErrorA(message, path.c_str(), EXIT_PROCESS, WITH_ERRNO);
}
