// One placeholder in a text, replaced wherever it stands and comes to stand.
#ifndef LAUNCHER_PROPERTIES_REPLACEMENT_H
#define LAUNCHER_PROPERTIES_REPLACEMENT_H

#include <string>

/// What values may bring in on top of what was asked for, in characters, before the replacing
/// counts as endless.
extern const unsigned long long MOST_BROUGHT_IN;

/// Replaces every `placeholder` in `s` by `value`, as if each search began at the start of `s`. The
/// first character of a placeholder is none of its others. False, with `s` as far as it came, when
/// that would never end.
bool replaceEvery(const std::wstring& placeholder, const std::wstring& value, std::wstring& s);

#endif
