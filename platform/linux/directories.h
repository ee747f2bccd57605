// Making directories, and removing whole trees with a report of what could not be removed.
#ifndef PLATFORM_LINUX_DIRECTORIES_H
#define PLATFORM_LINUX_DIRECTORIES_H

#include <string>

/// mkdir with mode 0775, less the umask. True on success.
bool createDirectory(const wchar_t* path);

/// Creates every level of `path`, always from the root: "a/b" makes "/a" and "/a/b". Both
/// separators count. The result is that of the last level alone, so it is false for a directory
/// that exists: ask isDirectory first. True for a path without parts.
bool mkdirs(const wchar_t* path);

/// mkdirs; true also when it failed because a directory stands there by now. Otherwise errno is
/// that of mkdirs.
bool ensureDirectory(const wchar_t* path);

/// Removes from `dir` every entry when `pattern` is exactly "*", sub-directories with all they
/// hold included; otherwise the plain files of `dir` itself whose names contain `pattern`. Links
/// are followed, into at most 10,000 directories. Goes on after every failure and adds a line to
/// `report` for each, in the order met, depth first. True when there was none. `indent` is handed
/// down and written nowhere.
bool removeDirectoryContents(const std::string& dir, const std::string& pattern,
                             const std::string& indent, std::string& report);

/// The same for everything.
bool removeDirectoryContents(const std::string& dir, const std::string& indent,
                             std::string& report);

/// The same by a wide path; on failure `errorText` receives the report.
bool removeDirectoryContents(const std::wstring& dir, std::wstring& errorText);

/// Empties `dir` and, only if that succeeded, removes it. On failure `errorText` receives the
/// report.
bool removeDirectoryAndContents(const std::wstring& dir, std::wstring& errorText);

/// Deletes the plain files of `dir` whose names contain `pattern`. On failure `errorText`
/// receives the report. A pattern that the locale cannot convert is a failure with an empty
/// report, and deletes nothing.
bool removeFileWithPatternFromDirectory(const std::wstring& dir, const std::wstring& pattern,
                                        std::wstring& errorText);

#endif
