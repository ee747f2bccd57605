// Time as text, for names and lines of the log. Knows nothing of the log itself.
#ifndef DIAG_TIME_STAMPS_H
#define DIAG_TIME_STAMPS_H

#include <string>

/// Sets `out` to the local time with milliseconds, for example "20111024_093015_042"
/// (year, month, day _ hour, minute, second _ millisecond). At most 29 characters.
void getTimeString(std::wstring& out);

/// Writes the whole seconds since the epoch in decimal into `buf`, which has room for `n`
/// characters, the terminating zero included. Returns `buf`; a text that does not fit is empty.
wchar_t* getTickString(wchar_t* buf, int n);

#endif
