/*
 * What plain.c knows of texts: properties, the placeholders in their values, and both conversions.
 * A text stays where it is put until the program ends. ASCII and no escapes: that is what there is.
 */
#ifndef BENCH_TEXTS_H
#define BENCH_TEXTS_H

#include "calls.h"

#include <wchar.h>

enum { ROOM = 16384, MOST = 64 };

struct pair {
    const wchar_t *key, *value;
};

struct pairs {
    size_t count;
    struct pair all[MOST];
};

/* What placeholders are replaced with: the launcher's properties, and the installation. */
static struct pairs launcher;
static const wchar_t* install_dir;

static wchar_t wide_texts[ROOM], *next_wide = wide_texts;
static char narrow_texts[ROOM], *next_narrow = narrow_texts;

static inline wchar_t* wide_room(size_t length)
{
    wchar_t* room = next_wide;
    if (length >= (size_t)(wide_texts + ROOM - room))
        exit(1);
    next_wide += length + 1;
    return room;
}

/* ASCII is itself in the locale of the measurement; other text ends the program. */
static inline wchar_t* widened(const char* from, size_t length)
{
    wchar_t* to = wide_room(length);
    for (size_t i = 0; i < length; i++) {
        if ((unsigned char)from[i] >= 0x80)
            exit(1);
        to[i] = (wchar_t)from[i];
    }
    to[length] = 0;
    return to;
}

static inline wchar_t* widen(const char* from)
{
    return from ? widened(from, strlen(from)) : widened("", 0);
}

static inline char* narrow(const wchar_t* from)
{
    char* to = next_narrow;
    for (; next_narrow < narrow_texts + ROOM && *from < 0x80; from++) {
        *next_narrow++ = (char)*from;
        if (!*from)
            return to;
    }
    exit(1);
}

static inline const wchar_t* joined(const wchar_t* first, const wchar_t* second,
                                    const wchar_t* third)
{
    size_t one = wcslen(first), two = wcslen(second), three = wcslen(third);
    wchar_t* to = wide_room(one + two + three);
    wmemcpy(to, first, one);
    wmemcpy(to + one, second, two);
    wmemcpy(to + one + two, third, three + 1);
    return to;
}

static inline const wchar_t* join(const wchar_t* first, const wchar_t* second)
{
    return joined(first, second, L"");
}

static inline const wchar_t* find(const struct pairs* in, const wchar_t* key)
{
    for (size_t i = 0; i < in->count; i++) {
        if (wcscmp(in->all[i].key, key) == 0)
            return in->all[i].value;
    }
    exit(1);
}

/* What stands for a name between braces. */
static inline const wchar_t* replacement(wchar_t* name)
{
    if (wcscmp(name, L"rcp.home") == 0)
        return install_dir;
    if (wcsncmp(name, L"env.", 4) != 0)
        return find(&launcher, name);
    wchar_t* otherwise = wcschr(name, L',');
    if (otherwise)
        *otherwise++ = 0;
    const char* value = getenv(narrow(name + 4));
    return value || !otherwise ? widen(value) : otherwise;
}

static inline const wchar_t* resolved(const wchar_t* value)
{
    const wchar_t *begin, *end;
    while ((begin = wcsstr(value, L"${")) && (end = wcschr(begin, L'}'))) {
        wchar_t* head = wide_room((size_t)(begin - value));
        wmemcpy(head, value, (size_t)(begin - value))[begin - value] = 0;
        wchar_t* name = wide_room((size_t)(end - begin) - 2);
        wmemcpy(name, begin + 2, (size_t)(end - begin) - 2)[end - begin - 2] = 0;
        value = joined(head, replacement(name), end + 1);
    }
    return value;
}

static inline void add_pair(struct pairs* to, wchar_t* line)
{
    if (to->count == MOST || wcschr(line, L'\\'))
        exit(1);
    wchar_t* value = wcschr(line, L'=');
    if (value)
        *value++ = 0;
    to->all[to->count++] = (struct pair){line, value ? value : L""};
}

static inline void read_pairs(const char* path, struct pairs* to)
{
    static const char blank[] = " \t\n\v\f\r";
    read_file(path);
    for (const char* line = text + strspn(text, blank); *line; line += strspn(line, blank)) {
        const char* end = strchrnul(line, '\n');
        if (*line != '#')
            add_pair(to, widened(line, (size_t)(end - line)));
        line = end;
    }
}

#endif
