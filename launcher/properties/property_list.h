// The list that every properties file is read into: key, value, key, value, in file order.
//
// Each entry is a block of its own from newString that the list owns. Duplicate keys stay; a
// lookup sees the first. A list passed by value is a borrowed copy: its entries belong to the
// caller's list. What a lookup lends is used before the next call that replaces an entry
// (replaceValue, insertPropToVmargMap, replacePlaceholdersInRcpInstallProp, patchWorkspace).
#ifndef LAUNCHER_PROPERTIES_PROPERTY_LIST_H
#define LAUNCHER_PROPERTIES_PROPERTY_LIST_H

#include <cstdlib>
#include <string>
#include <vector>

typedef std::vector<wchar_t*> PropertyList;

/// Appends a pair as it stands. Fatal: QVMRL0004E, out of memory.
void appendProperty(PropertyList& list, const std::wstring& key, const std::wstring& value);

/// Appends one pair, treated as the reader treats one from a file: the key trimmed, the value
/// unescaped and trimmed. Changes both texts. Traces QVMRL0126I and QVMRL0127I.
void pushBackProperty(PropertyList& list, std::wstring& key, std::wstring& value);

/// The value of the first pair whose key equals `key`; null when there is none. Lent.
wchar_t* findProperty(const wchar_t* key, const PropertyList& list);

/// A new array (from malloc, released with free, the texts are lent) of key, value, key, value
/// for every pair whose key begins with `prefix`, in list order, and an empty text at its end.
/// Stops at the first pair of the list that has an empty key.
/// Fatal: "QVMRL0046E: findProperties malloc for property strings failed!".
wchar_t** findProperties(const wchar_t* prefix, const PropertyList& list);

/// Holds what findProperties returned, and frees it.
struct FoundProperties {
    FoundProperties(const wchar_t* prefix, const PropertyList& list)
        : pairs(findProperties(prefix, list))
    {}
    ~FoundProperties()
    {
        free(static_cast<void*>(pairs));
    }
    FoundProperties(const FoundProperties&) = delete;
    FoundProperties& operator=(const FoundProperties&) = delete;

    /// The pairs; at the end pairs[n] is an empty text.
    wchar_t** pairs;
};

/// Replaces the text behind the first element, key or value, that equals `key` by a copy of
/// `newValue`. Does nothing when there is none. Fatal: QVMRL0004E.
void replaceValue(const wchar_t* key, const wchar_t* newValue, PropertyList& list);

/// Sets `out` to key=value and one NUL that counts in its length.
void setArgProperty(std::wstring& out, const wchar_t* key, const wchar_t* value);

/// Releases every text of `list` and empties it.
void freeProperties(PropertyList& list);

#endif
