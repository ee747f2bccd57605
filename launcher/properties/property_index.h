// An index beside a long property list that is searched again and again, so that the list is not
// walked for every question.
//
// It belongs to the list that was searched last, as it was then: to its length, its first and its
// last entry. A list that has grown, or another one, is walked at first and then indexed anew; a
// copy has the same entries, and so the same index. Whoever puts another key into a list, or
// releases a key or the whole list, forgets the index.
#ifndef LAUNCHER_PROPERTIES_PROPERTY_INDEX_H
#define LAUNCHER_PROPERTIES_PROPERTY_INDEX_H

#include <vector>

/// A property list, as property_list.h has it.
typedef std::vector<wchar_t*> IndexedList;

/// A list has an index from so many pairs on, and behind so many searches: building one costs what
/// about as many walks do.
const IndexedList::size_type INDEXED_PAIRS = 256;
const unsigned UNINDEXED_SEARCHES = 32;

/// True when this search of `list` is one for findByIndex; a search that walks is counted.
bool isIndexed(const IndexedList& list);

/// The place of the first key of `list` that equals `key`; the length of the list when there is
/// none. Only behind isIndexed. Fatal: QVMRL0004E.
IndexedList::size_type findByIndex(const wchar_t* key, const IndexedList& list);

/// Has the next search build the index again.
void forgetIndex();

#endif
