#include "launcher/properties/placeholders.h"

#include "diag/SvcDebug_linux.h"
#include "launcher/properties/replacement.h"
#include "platform/linux/environment.h"
#include "platform/linux/paths.h"
#include "platform/linux/wide_strings.h"

#include <cwchar>
#include <vector>

static void endInvalidSubstitution(const std::wstring& text)
{
    fatalErrorA("QVMRL0088E: property substitution is invalid (%ls)", text.c_str(), EXIT_PROCESS,
                WITH_ERRNO);
}

static bool replaceStandard(const std::wstring& placeholder, const std::wstring& value,
                            std::wstring& s)
{
    if (s.find(placeholder) == std::wstring::npos)
        return false;
    if (!replaceEvery(placeholder, value, s))
        endInvalidSubstitution(s);
    return true;
}

bool replaceStdPlaceholders(const std::wstring& workspace, const std::wstring& rcpHome,
                            std::wstring& s)
{
    const bool home = replaceStandard(L"${rcp.home}", rcpHome, s);
    const bool location = replaceStandard(L"${workspace.location}", workspace, s);
    const bool data = replaceStandard(L"${rcp.data}", workspace, s);
    return home || location || data;
}

std::wstring::size_type findLastPlaceholder(const std::wstring& s, std::wstring::size_type pos,
                                            std::wstring::size_type& length, std::wstring& name)
{
    const std::wstring::size_type start = s.rfind(L"${", pos);
    if (start == std::wstring::npos)
        return std::wstring::npos;
    std::wstring::size_type end = s.find(L'}', start);
    if (end == std::wstring::npos || end > pos)
        end = pos;
    length = end - start + 1;
    if (length > 2)
        name = s.substr(start + 2, length - 3);
    else
        name.clear();
    return start;
}

bool getPlaceholderValue(const std::wstring& name, std::wstring& value, const PropertyList& props)
{
    if (name.compare(0, 4, L"env.") == 0) {
        const std::wstring::size_type comma = name.find(L',');
        const std::wstring variable = name.substr(0, comma).substr(4);
        if (getEnv(variable.c_str(), value))
            return true;
        if (comma != std::wstring::npos) {
            value = name.substr(comma + 1);
            return true;
        }
    }
    if (name.compare(0, 5, L"prop.") == 0) {
        const wchar_t* found = findProperty(name.substr(5).c_str(), props);
        if (found != nullptr) {
            value = found;
            return true;
        }
    }
    value = L"${" + name + L"}";
    return false;
}

// The text that replaceUserPlaceholders works on. What lies behind the place of the next search is
// never looked at again but for its first character, so it is set aside, in pieces: a value with
// many placeholders costs what its length is, not the square of it.
struct Resolving {
    std::wstring head;
    std::vector<std::wstring> tail; // the last piece is the first in the text

    std::wstring text() const
    {
        std::wstring all = head;
        for (auto piece = tail.rbegin(); piece != tail.rend(); ++piece)
            all += *piece;
        return all;
    }

    void setAsideFrom(std::wstring::size_type start)
    {
        if (start < head.size())
            tail.push_back(head.substr(start));
        head.resize(start);
    }

    // As findLastPlaceholder at the end of the head.
    std::wstring::size_type findLast(std::wstring::size_type& length, std::wstring& name) const
    {
        if (head.empty())
            return std::wstring::npos;
        if (head.back() == L'$' && !tail.empty() && tail.back()[0] == L'{') {
            length = 1;
            name.clear();
            return head.size() - 1;
        }
        return findLastPlaceholder(head, head.size() - 1, length, name);
    }
};

bool replaceUserPlaceholders(std::wstring& s, const PropertyList& props)
{
    Resolving work{s, {}};
    std::wstring::size_type lastStart = std::wstring::npos;
    std::wstring::size_type lowestStart = std::wstring::npos;
    unsigned long long left = MOST_BROUGHT_IN;
    bool ok = true;
    int repeats = 0;
    std::wstring::size_type length = 0;
    std::wstring name;
    for (;;) {
        const std::wstring::size_type start = work.findLast(length, name);
        if (start == std::wstring::npos)
            break;
        std::wstring value;
        if (!getPlaceholderValue(name, value, props))
            ok = false;
        const std::wstring before = isTracing() ? work.text() : std::wstring();
        work.setAsideFrom(start + length);
        work.head.replace(start, length, value);
        if (isTracing())
            SvcDebugOutW(L"QVMRL0071I: Modified prop_contents %s",
                         (before + L" => " + work.text()).c_str());
        if (lastStart != std::wstring::npos && start >= lastStart) {
            ++repeats;
            if (repeats > 9) {
                ok = false;
                break;
            }
        } else {
            repeats = 0;
        }
        // Decision: a value that brings itself in beside another placeholder begins the count of
        // repetitions again each time and would never end. A placeholder that stands no further
        // left than the leftmost so far came in with a value; these have a limit of their own.
        if (start < lowestStart) {
            lowestStart = start;
        } else if (left <= value.size()) {
            ok = false;
            break;
        } else {
            left -= value.size() + 1;
        }
        // Deliberate: from the first failure on, a value is not searched for placeholders again.
        if (!ok) {
            if (start == 0)
                break;
            work.setAsideFrom(start);
        }
        lastStart = start;
    }
    s = work.text();
    return ok;
}

bool replaceAllPlaceholders(const std::wstring& workspace, const std::wstring& rcpHome,
                            std::wstring& s, const PropertyList& props)
{
    if (s.find(L"${") == std::wstring::npos)
        return false;
    bool changed = replaceStdPlaceholders(workspace, rcpHome, s);
    if (s.find(L"${") == std::wstring::npos)
        return changed;
    std::wstring resolved = s;
    if (!replaceUserPlaceholders(resolved, props))
        endInvalidSubstitution(resolved);
    if (resolved != s) {
        s = resolved;
        changed = true;
    }
    return changed;
}

void replacePlaceholdersInVmargMap(std::wstring workspace, std::wstring rcpHome,
                                   const PropertyList& props, VmargMap& map)
{
    convertBS2S(workspace);
    convertBS2S(rcpHome);
    // Deliberate: without properties not even the standard placeholders are replaced.
    if (props.empty())
        return;
    for (VmargMap::value_type& entry : map)
        replaceAllPlaceholders(workspace, rcpHome, entry.second, props);
}

void replacePlaceholdersInRcpInstallProp(std::wstring workspace, std::wstring rcpHome,
                                         PropertyList& props)
{
    convertBS2S(workspace);
    convertBS2S(rcpHome);
    for (PropertyList::size_type i = 1; i < props.size(); i += 2) {
        std::wstring value = props[i];
        if (!replaceAllPlaceholders(workspace, rcpHome, value, props))
            continue;
        wchar_t* replaced = props[i];
        props[i] = initMemString(newString(value.size()), value.c_str());
        freeString(replaced);
    }
}

void replacePlaceholdersInArgv(std::wstring workspace, std::wstring rcpHome, wchar_t*** argv,
                               wchar_t*** changed, int argc)
{
    static wchar_t unchanged[1] = L"";
    convertBS2S(workspace);
    convertBS2S(rcpHome);
    for (int i = 0; i < argc; ++i) {
        std::wstring word = (*argv)[i];
        if (!replaceStdPlaceholders(workspace, rcpHome, word)) {
            (*changed)[i] = unchanged;
            continue;
        }
        wchar_t* copy = initMemString(newString(word.size()), word.c_str());
        (*argv)[i] = copy;
        (*changed)[i] = copy;
    }
}

void fixUpJvmLibPath(std::wstring& path)
{
    const std::wstring home = L"${prop.java.home}";
    const std::wstring::size_type length = path.size();
    std::wstring list = path + L":";
    convertBS2S(list);
    std::wstring out;
    std::wstring::size_type start = 0;
    do {
        const std::wstring::size_type colon = list.find(L':', start);
        if (colon == std::wstring::npos)
            break;
        const std::wstring entry = list.substr(start, colon - start);
        if (entry.size() != 1) {
            if (entry.find(home) == std::wstring::npos)
                out += home + L"/";
            out += entry;
            if (colon < length - 1)
                out += L':';
        }
        // Deliberate: the start is added to a position that counts from the beginning already, so
        // from the second entry on the scan skips ahead.
        start += colon + 1;
    } while (start < length);
    path = out;
}
