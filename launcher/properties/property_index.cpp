#include "launcher/properties/property_index.h"

#include <cstdint>
#include <cwchar>

// A hash table with open addressing: a slot holds the number of a pair, counted from 1, and 0 is
// an empty one. At least half of the slots are empty.
struct PropertyIndex {
    IndexedList::size_type size = 0;
    const wchar_t* first = nullptr;
    const wchar_t* last = nullptr;
    unsigned searches = 0;
    std::vector<uint32_t> slots;
};

static PropertyIndex longList;

bool isIndexed(const IndexedList& list)
{
    if (list.size() < 2 * INDEXED_PAIRS)
        return false;
    if (list.size() != longList.size || list.front() != longList.first ||
        list.back() != longList.last) {
        longList.size = list.size();
        longList.first = list.front();
        longList.last = list.back();
        longList.searches = 0;
        longList.slots.clear();
    }
    return ++longList.searches > UNINDEXED_SEARCHES;
}

// The place of the key of the pair with this number.
static IndexedList::size_type keyOf(uint32_t pair)
{
    return (IndexedList::size_type(pair) - 1) * 2;
}

// The slot of the pair with this key, or the empty one where it belongs.
static uint32_t& slotOf(const wchar_t* key, const IndexedList& list)
{
    uint32_t hash = 2166136261U;
    for (const wchar_t* c = key; *c != L'\0'; ++c)
        hash = (hash ^ static_cast<uint32_t>(*c)) * 16777619U;
    const size_t mask = longList.slots.size() - 1;
    size_t at = (hash ^ (hash >> 15U)) & mask;
    while (longList.slots[at] != 0 && wcscmp(list[keyOf(longList.slots[at])], key) != 0)
        at = (at + 1) & mask;
    return longList.slots[at];
}

static void build(const IndexedList& list)
{
    const size_t pairs = list.size() / 2;
    size_t room = 1024;
    while (room < 2 * pairs)
        room *= 2;
    longList.slots.assign(room, 0);
    for (size_t pair = 0; pair < pairs; ++pair) {
        uint32_t& slot = slotOf(list[2 * pair], list);
        // Of equal keys the first one counts.
        if (slot == 0)
            slot = static_cast<uint32_t>(pair + 1);
    }
}

IndexedList::size_type findByIndex(const wchar_t* key, const IndexedList& list)
{
    if (longList.slots.empty())
        build(list);
    const uint32_t pair = slotOf(key, list);
    return pair == 0 ? list.size() : keyOf(pair);
}

void forgetIndex()
{
    longList.size = 0;
}
