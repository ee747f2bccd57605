#include "platform/linux/text_source.h"

#include "diag/narrow.h"

#include <cerrno>

bool TextSource::readPiece(std::wstring& piece)
{
    static const std::wstring::size_type LONGEST = 1000;
    piece.clear();
    const bool shortWay = asciiIsItself();
    int byte = 0;
    while (piece.size() < LONGEST && (byte = getc_unlocked(file)) != EOF) {
        auto c = static_cast<wchar_t>(byte);
        if (!shortWay || byte >= 0x80 || inCharacter) {
            const char one = static_cast<char>(byte);
            const size_t used = mbrtowc(&c, &one, 1, &state);
            inCharacter = used == static_cast<size_t>(-2);
            if (used == static_cast<size_t>(-1)) {
                undecodable = true;
                return false;
            }
            if (inCharacter)
                continue;
        }
        piece += c;
        if (c == L'\n')
            break;
    }
    return !piece.empty() && ferror(file) == 0;
}

bool TextSource::isAtItsEnd()
{
    if (undecodable || feof(file) == 0 || ferror(file) != 0)
        return false;
    if (mbsinit(&state) != 0)
        return true;
    errno = EILSEQ;
    return false;
}
