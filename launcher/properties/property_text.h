// The rules of a single line, key or value of a properties file.
#ifndef LAUNCHER_PROPERTIES_PROPERTY_TEXT_H
#define LAUNCHER_PROPERTIES_PROPERTY_TEXT_H

#include <string>

/// Removes spaces (no other white space) from both ends. A text of spaces alone stays.
void trimString(std::wstring& s);

/// What becomes of a key: trimString.
void FilterProp(std::wstring& key);

/// What becomes of a value: a doubled backslash gives one; "\u" and the up to four characters
/// behind it give the character of the hexadecimal digits that they begin with ("\u41xy" gives
/// "A"); before any other character the backslash goes. Then trimString. A character of code 0 is
/// kept here, and cuts the value where it is read as a C string.
void FilterValue(std::wstring& value);

/// True for a line that begins with "#" or "!": the rule of copied lines. The reader knows "#"
/// alone.
bool isComment(const std::wstring& line);

/// True for a line that ends in an odd number of backslashes, its first character not counted.
bool isContinuationLine(const std::wstring& line);

/// The platform filter of copied lines. Removes leading spaces. True when the key ends in the name
/// of another system (".win32...", ".macosx...") and the line is to be dropped. From a key that
/// ends in this system's name that ending is removed. Lines that begin with "-D" are not judged.
bool processFilterKey(std::wstring& line);

#endif
