// Paths in the one form that the launcher uses: "/" between the parts.
#ifndef PLATFORM_LINUX_PATHS_H
#define PLATFORM_LINUX_PATHS_H

#include <string>

/// The backslash, as text.
extern const wchar_t* const BS_CHAR;

/// Folds "//", "." and ".." of `path`. The result begins with "/", also for a relative path, and
/// keeps a "/" at its end. "." goes only behind another segment. Behind "..", the segment that
/// follows the next one is lost as well: "/a/../b/c/d" gives "/b/d". An empty path stays empty.
/// Fatal: QVMRL0004E, out of memory.
void convertToStandardPathForm(std::wstring& path);

/// The same under its second name.
void normalizePath(std::wstring& path);

/// Turns every backslash into a slash.
void convertBS2S(std::wstring& s);

/// Turns every slash into a backslash.
void convertS2BS(std::wstring& s);

/// Makes `s` a path of this system: as convertBS2S. Every path passes through here after it is
/// put together and before it is used.
void convertToOsSeparator(std::wstring& s);

/// True when `s` ends with `suffix` (up to its first NUL). The arithmetic is unsigned: a suffix
/// exactly one character longer than `s` that does not occur in it counts as found.
bool endsIn(const std::wstring& s, const std::wstring& suffix);

#endif
