// The one reader of every properties file.
//
// The dialect resembles java.util.Properties and is not it: only "#" begins a comment; a key has
// no escapes; of "\" before ":", "#", " " and "=" only the backslash goes, the character keeps its
// meaning; "\t" is "t"; a line of more than 2024 bytes is read as two; and a line that begins with
// "-X" keeps its separators at the head of the value, so that key and value give the line back.
#ifndef LAUNCHER_PROPERTIES_PROPERTY_FILE_H
#define LAUNCHER_PROPERTIES_PROPERTY_FILE_H

#include "launcher/properties/property_list.h"

#include <string>

/// Reads the file at `path` and appends its pairs to `list`. Traces each line (QVMRL0032I), key
/// (QVMRL0023I) and value (QVMRL0024I). There is no syntax error: each line is part of a pair or
/// ignored. Fatal: "QVMRL0096E: Unable to load %ls file!" with the reason; QVMRL0004E.
void getProperties(const std::wstring& path, PropertyList& list);

/// The same for a file that need not be there. False, and nothing read, when it cannot be opened.
bool getPropertiesIfPresent(const std::wstring& path, PropertyList& list);

#endif
