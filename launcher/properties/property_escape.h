// Escaping for the reader of Java properties files (the format that java.util.Properties loads):
// what is not printable ASCII becomes "\u" and four digits, what is special gets a backslash.
#ifndef LAUNCHER_PROPERTIES_PROPERTY_ESCAPE_H
#define LAUNCHER_PROPERTIES_PROPERTY_ESCAPE_H

#include <string>

/// Appends `code` as four lower-case hexadecimal digits; a larger one keeps its low 16 bits.
void addHexDigits(std::wstring& out, unsigned code);

/// Appends `in`, escaped as a key (spaces too) or as a value, to `out`.
void convWcharTo8859_1_Key(const std::wstring& in, std::wstring& out);
void convWcharTo8859_1_Value(const std::wstring& in, std::wstring& out);

/// Appends the escaped key, "=", and the escaped value to `out`; no line end.
void convWcharTo8859_1(const std::wstring& key, const std::wstring& value, std::wstring& out);

#endif
