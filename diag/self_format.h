// A text that is used as its own format.
//
// A few lines of the log, and the block at the end of the user's install properties, are a whole
// text, values included, that is interpreted as a format. The values come from command lines,
// links and files, so the C library must never see them as one: a conversion without an argument
// is undefined there. These two functions are the only place where such a text is interpreted.
#ifndef DIAG_SELF_FORMAT_H
#define DIAG_SELF_FORMAT_H

#include <string>

/// The text as it comes out when it is its own format and has no argument:
/// - "%%" gives "%";
/// - any other complete conversion ("%", flags, width, precision, length, and one of
///   diouxXeEfFgGaAcsCSpnm) gives nothing; no memory is read or written for it;
/// - anything else that begins with "%" (an unknown letter, the end of the text) stays.
std::wstring formatOfItself(const std::wstring& text);

/// The same on bytes; bytes above 127 are passed on one by one.
std::string formatOfItself(const std::string& text);

#endif
