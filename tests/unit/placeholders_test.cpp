#include "launcher/properties/placeholders.h"
#include "launcher/properties/replacement.h"

#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <cstdlib>
#include <memory>
#include <ostream>
#include <random>

typedef std::vector<std::wstring> Texts;
typedef std::wstring::size_type Position;

static const Position NONE = std::wstring::npos;

// A list of its own, freed at the end of the test.
struct OwnList {
    OwnList(std::initializer_list<const wchar_t*> keysAndValues) : list(pairs(keysAndValues)) {}
    ~OwnList()
    {
        freeProperties(list);
    }
    OwnList(const OwnList&) = delete;
    OwnList& operator=(const OwnList&) = delete;

    PropertyList list;
};

// A text and what a function said of it.
struct Outcome {
    bool result;
    std::wstring text;

    bool operator==(const Outcome& other) const
    {
        return result == other.result && text == other.text;
    }
};

static std::ostream& operator<<(std::ostream& out, const Outcome& outcome)
{
    return out << outcome.result << " " << testing::PrintToString(outcome.text);
}

static Outcome standard(std::wstring s)
{
    const bool result = replaceStdPlaceholders(L"/ws", L"/rcp", s);
    return {result, s};
}

static Outcome user(std::wstring s, const PropertyList& props)
{
    const bool result = replaceUserPlaceholders(s, props);
    return {result, s};
}

static Outcome all(std::wstring s, const PropertyList& props)
{
    const bool result = replaceAllPlaceholders(L"/ws", L"/rcp", s, props);
    return {result, s};
}

static std::wstring fixedUp(std::wstring path)
{
    fixUpJvmLibPath(path);
    return path;
}

// ${prop.java.home}
static const std::wstring HOME = L"${prop.java.home}";

TEST(replaceEvery, TellsWhetherItCameToAnEnd)
{
    std::wstring s = L"a${x}b${x}";
    EXPECT_TRUE(replaceEvery(L"${x}", L"1", s));
    EXPECT_EQ(s, L"a1b1");
    EXPECT_TRUE(replaceEvery(L"${x}", L"${x}", s));
    EXPECT_EQ(s, L"a1b1");
    s = L"a${x}";
    EXPECT_FALSE(replaceEvery(L"${x}", L"-${x}-", s));
    EXPECT_EQ(s, L"a${x}");
}

// The first placeholder of `s` replaced, again and again. False when it does not end.
static bool replacedOneByOne(const std::wstring& placeholder, const std::wstring& value,
                             std::wstring& s)
{
    for (int step = 0; step < 1000; ++step) {
        const std::wstring::size_type found = s.find(placeholder);
        if (found == std::wstring::npos)
            return true;
        s.replace(found, placeholder.size(), value);
    }
    return false;
}

TEST(replaceEvery, DoesAsIfEachSearchBeganAtTheStart)
{
    unsigned random = 6;
    const auto text = [&random](unsigned longest) {
        std::wstring made;
        random = random * 1103515245 + 12345;
        for (unsigned length = random / 65536 % (longest + 1); length > 0; --length) {
            random = random * 1103515245 + 12345;
            made += L"${x}-x"[random / 65536 % 6];
        }
        return made;
    };
    int ended = 0;
    for (int i = 0; i < 200000; ++i) {
        const std::wstring value = text(5);
        const std::wstring given =
            text(3) + L"${x}" + text(9) + (i % 2 == 0 ? L"${x}" : L"") + text(4);
        std::wstring expected = given;
        if (!replacedOneByOne(L"${x}", value, expected))
            continue;
        std::wstring s = given;
        EXPECT_TRUE(replaceEvery(L"${x}", value, s)) << given << " with " << value;
        EXPECT_EQ(s, expected) << given << " with " << value;
        ended += s != given;
    }
    EXPECT_GT(ended, 150000);
}

TEST(replaceEvery, ValuesThatOnlyGrowAreReplacedToTheEnd)
{
    // A hundred of them, and what they bring in is a hundred times as long.
    std::wstring s;
    std::wstring wanted;
    const std::wstring value(500, L'v');
    for (int i = 0; i < 100; ++i) {
        s += L"${x}";
        wanted += value;
    }
    EXPECT_TRUE(replaceEvery(L"${x}", value, s));
    EXPECT_EQ(s, wanted);
}

TEST(replaceEvery, WhatWasAskedForHasNoLimitBesideAValueThatCompletesOne)
{
    std::wstring s;
    for (int i = 0; i < 100; ++i)
        s += L"${x}";
    s += L"$${x}"; // the value completes this one
    const std::wstring value = L"{x}" + std::wstring(30000, L'y');
    EXPECT_TRUE(replaceEvery(L"${x}", value, s));
    // A hundred and two values; of the last but one its first three characters are gone.
    EXPECT_EQ(s.size(), 102 * value.size() - 3);
}

TEST(replaceEvery, ValueThatNeverStopsCompletingAPlaceholderIsFound)
{
    // With a for "${" and b for "x}" this puts bbaa for ab, and abb grows for ever: abb, bbaab,
    // bbabbaa, which holds abb again.
    std::wstring s = L"${x}x}";
    EXPECT_FALSE(replaceEvery(L"${x}", L"x}x}${${", s));
    EXPECT_FATAL(
        {
            std::wstring text = L"${rcp.home}home}";
            replaceStdPlaceholders(L"/ws", L"home}home}${rcp.${rcp.", text);
        },
        "QVMRL0088E: property substitution is invalid (home}home}");
}

TEST(replaceStdPlaceholders, EveryOneOfTheThree)
{
    EXPECT_EQ(standard(L"a${rcp.home}b${rcp.home}"), (Outcome{true, L"a/rcpb/rcp"}));
    EXPECT_EQ(standard(L"${workspace.location}/x"), (Outcome{true, L"/ws/x"}));
    EXPECT_EQ(standard(L"${rcp.data}${workspace.location}${rcp.home}"),
              (Outcome{true, L"/ws/ws/rcp"}));
}

TEST(replaceStdPlaceholders, NothingElse)
{
    for (const wchar_t* text : {L"", L"a", L"${rcp.Home}", L"${RCP.HOME}", L"${rcp.home",
                                L"$rcp.home", L"{rcp.data}", L"${ rcp.data}", L"${prop.a}", L"${}"})
        EXPECT_EQ(standard(text), (Outcome{false, text}));
}

TEST(replaceStdPlaceholders, ValueMayBeEmpty)
{
    std::wstring s = L"a${rcp.data}b${rcp.data}${rcp.home}c";
    EXPECT_TRUE(replaceStdPlaceholders(L"", L"", s));
    EXPECT_EQ(s, L"abc");
}

TEST(replaceStdPlaceholders, LaterOnesSeeWhatTheHomeBroughtIn)
{
    std::wstring s = L"${rcp.home}";
    EXPECT_TRUE(replaceStdPlaceholders(L"/ws", L"/r${rcp.data}/${workspace.location}", s));
    EXPECT_EQ(s, L"/r/ws//ws");
}

TEST(replaceStdPlaceholders, EarlierOnesAreNotLookedForAgain)
{
    std::wstring s = L"${rcp.data}";
    EXPECT_TRUE(replaceStdPlaceholders(L"${rcp.home}", L"/rcp", s));
    EXPECT_EQ(s, L"${rcp.home}");
    s = L"${workspace.location}";
    EXPECT_TRUE(replaceStdPlaceholders(L"${rcp.data", L"/rcp", s));
    EXPECT_EQ(s, L"${rcp.data");
}

TEST(replaceStdPlaceholders, ValueMayCompleteThePlaceholder)
{
    // "${rcp." + "" + "home}", then "" again.
    std::wstring s = L"${rcp.${rcp.home}home}!";
    EXPECT_TRUE(replaceStdPlaceholders(L"/ws", L"", s));
    EXPECT_EQ(s, L"!");
    // Each search begins at the start: the value "home}" completes the one before it.
    s = L"${rcp.${rcp.home}";
    EXPECT_TRUE(replaceStdPlaceholders(L"/ws", L"home}", s));
    EXPECT_EQ(s, L"home}");
    s = L"${rcp.home}}";
    EXPECT_TRUE(replaceStdPlaceholders(L"/ws", L"${rcp.home", s));
    EXPECT_EQ(s, L"${rcp.home");
    s = L"${rcp.${rcp.home}ome}";
    EXPECT_TRUE(replaceStdPlaceholders(L"/ws", L"h", s));
    EXPECT_EQ(s, L"h");
}

TEST(replaceStdPlaceholders, ValueThatHoldsItsOwnPlaceholderEnds)
{
    EXPECT_TRUE(endsWith(
        [] {
            std::wstring s = L"x${rcp.home}${rcp.data}";
            errno = EINVAL;
            replaceStdPlaceholders(L"/a${rcp.data}", L"/rcp", s);
        },
        "QVMRL0088E: property substitution is invalid (x/rcp${rcp.data})", EINVAL));
    EXPECT_TRUE(endsWith(
        [] {
            std::wstring s = L"${rcp.home}";
            errno = EINVAL;
            replaceStdPlaceholders(L"/ws", L"${rcp.home}", s);
        },
        "QVMRL0088E: property substitution is invalid (${rcp.home})", EINVAL));
    EXPECT_TRUE(endsWith(
        [] {
            std::wstring s = L"${workspace.location}";
            errno = EINVAL;
            replaceStdPlaceholders(L"${workspace.location}/x", L"/rcp", s);
        },
        "QVMRL0088E: property substitution is invalid (${workspace.location})", EINVAL));
}

TEST(replaceStdPlaceholders, ValueThatHoldsItsOwnPlaceholderIsHarmlessWhereThereIsNone)
{
    std::wstring s = L"${rcp.home}";
    EXPECT_TRUE(replaceStdPlaceholders(L"/a${workspace.location}${rcp.data}", L"/rcp", s));
    EXPECT_EQ(s, L"/rcp");
}

TEST(findLastPlaceholder, LastOneAtOrBeforeThePosition)
{
    const std::wstring s = L"${a}-${bc}";
    Position length = 0;
    std::wstring name;
    EXPECT_EQ(findLastPlaceholder(s, 9, length, name), 5u);
    EXPECT_EQ(length, 5u);
    EXPECT_EQ(name, L"bc");
    EXPECT_EQ(findLastPlaceholder(s, 4, length, name), 0u);
    EXPECT_EQ(length, 4u);
    EXPECT_EQ(name, L"a");
    EXPECT_EQ(findLastPlaceholder(s, NONE, length, name), 5u);
}

TEST(findLastPlaceholder, EndsAtTheFirstBracketBehindIt)
{
    Position length = 0;
    std::wstring name;
    EXPECT_EQ(findLastPlaceholder(L"}${a}}", 5, length, name), 1u);
    EXPECT_EQ(length, 4u);
    EXPECT_EQ(name, L"a");
    EXPECT_EQ(findLastPlaceholder(L"${a${b}}", 7, length, name), 3u);
    EXPECT_EQ(name, L"b");
}

TEST(findLastPlaceholder, UnclosedOneRunsToThePositionAndLosesItsLastCharacter)
{
    Position length = 0;
    std::wstring name;
    EXPECT_EQ(findLastPlaceholder(L"x${abc", 5, length, name), 1u);
    EXPECT_EQ(length, 5u);
    EXPECT_EQ(name, L"ab");
    // Its bracket lies behind the position.
    EXPECT_EQ(findLastPlaceholder(L"${abcd}", 4, length, name), 0u);
    EXPECT_EQ(length, 5u);
    EXPECT_EQ(name, L"ab");
}

TEST(findLastPlaceholder, ShortOnesHaveNoName)
{
    Position length = 0;
    std::wstring name = L"before";
    EXPECT_EQ(findLastPlaceholder(L"${}", 2, length, name), 0u);
    EXPECT_EQ(length, 3u);
    EXPECT_EQ(name, L"");
    name = L"before";
    EXPECT_EQ(findLastPlaceholder(L"${", 1, length, name), 0u);
    EXPECT_EQ(length, 2u);
    EXPECT_EQ(name, L"");
    name = L"before";
    EXPECT_EQ(findLastPlaceholder(L"${a}", 0, length, name), 0u);
    EXPECT_EQ(length, 1u);
    EXPECT_EQ(name, L"");
}

TEST(findLastPlaceholder, NothingIsTouchedWhenThereIsNone)
{
    Position length = 77;
    std::wstring name = L"before";
    EXPECT_EQ(findLastPlaceholder(L"a$b{c}", 5, length, name), NONE);
    EXPECT_EQ(findLastPlaceholder(L"a${b}", 0, length, name), NONE);
    EXPECT_EQ(findLastPlaceholder(L"", NONE, length, name), NONE);
    EXPECT_EQ(length, 77u);
    EXPECT_EQ(name, L"before");
}

TEST(getPlaceholderValue, Property)
{
    const OwnList props({L"a", L"1", L"a", L"2", L"e", L"", L"", L"nokey", L"env.X", L"3"});
    std::wstring value = L"before";
    EXPECT_TRUE(getPlaceholderValue(L"prop.a", value, props.list));
    EXPECT_EQ(value, L"1");
    EXPECT_TRUE(getPlaceholderValue(L"prop.e", value, props.list));
    EXPECT_EQ(value, L"");
    EXPECT_TRUE(getPlaceholderValue(L"prop.", value, props.list));
    EXPECT_EQ(value, L"nokey");
    EXPECT_TRUE(getPlaceholderValue(L"prop.env.X", value, props.list));
    EXPECT_EQ(value, L"3");
}

TEST(getPlaceholderValue, MissingPropertyIsPutBack)
{
    const OwnList props({L"a", L"1"});
    std::wstring value = L"before";
    EXPECT_FALSE(getPlaceholderValue(L"prop.b", value, props.list));
    EXPECT_EQ(value, L"${prop.b}");
    // A property has no default.
    EXPECT_FALSE(getPlaceholderValue(L"prop.a,b", value, props.list));
    EXPECT_EQ(value, L"${prop.a,b}");
}

TEST(getPlaceholderValue, UnknownKindIsPutBack)
{
    const OwnList props({L"a", L"1", L"prop.a", L"2"});
    for (const wchar_t* name :
         {L"", L"a", L"prop", L"Prop.a", L"PROP.a", L" prop.a", L"rcp.home", L"en"}) {
        std::wstring value = L"before";
        EXPECT_FALSE(getPlaceholderValue(name, value, props.list));
        EXPECT_EQ(value, L"${" + std::wstring(name) + L"}");
    }
}

TEST(getPlaceholderValue, EnvironmentVariable)
{
    setenv("VELMORA_T", "t\xc3\xa9xt", 1);
    setenv("VELMORA_E", "", 1);
    std::wstring value = L"before";
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_T", value, PropertyList()));
    EXPECT_EQ(value, L"t\u00e9xt");
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_T,dflt", value, PropertyList()));
    EXPECT_EQ(value, L"t\u00e9xt");
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_E,dflt", value, PropertyList()));
    EXPECT_EQ(value, L"");
}

TEST(getPlaceholderValue, DefaultOfAnEnvironmentVariable)
{
    std::wstring value = L"before";
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_NO,dflt", value, PropertyList()));
    EXPECT_EQ(value, L"dflt");
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_NO,a,b", value, PropertyList()));
    EXPECT_EQ(value, L"a,b");
    EXPECT_TRUE(getPlaceholderValue(L"env.VELMORA_NO,", value, PropertyList()));
    EXPECT_EQ(value, L"");
    EXPECT_TRUE(getPlaceholderValue(L"env.,d", value, PropertyList()));
    EXPECT_EQ(value, L"d");
}

TEST(getPlaceholderValue, UnsetVariableWithoutADefaultIsPutBack)
{
    std::wstring value = L"before";
    EXPECT_FALSE(getPlaceholderValue(L"env.VELMORA_NO", value, PropertyList()));
    EXPECT_EQ(value, L"${env.VELMORA_NO}");
    EXPECT_FALSE(getPlaceholderValue(L"env.", value, PropertyList()));
    EXPECT_EQ(value, L"${env.}");
}

TEST(getPlaceholderValue, UnsetVariableIsTraced)
{
    std::wstring value;
    EXPECT_EQ(
        logOf(true, [&] { getPlaceholderValue(L"env.VELMORA_NO,dflt", value, PropertyList()); }),
        "QVMRL0081I:  Environmental variable 'VELMORA_NO' is not set\n\n");
}

TEST(replaceUserPlaceholders, ValuesAreResolvedAgain)
{
    const OwnList props({L"a", L"1", L"b", L"${prop.a}2"});
    EXPECT_EQ(user(L"x${prop.b}y", props.list), (Outcome{true, L"x12y"}));
    EXPECT_EQ(user(L"${prop.b}${prop.a}", props.list), (Outcome{true, L"121"}));
}

TEST(replaceUserPlaceholders, TextWithoutPlaceholdersIsASuccess)
{
    for (const wchar_t* text : {L"", L"a", L"$", L"{", L"$a{b}", L"}"})
        EXPECT_EQ(user(text, PropertyList()), (Outcome{true, text}));
}

TEST(replaceUserPlaceholders, WhatCannotBeResolvedStays)
{
    const OwnList props({L"a", L"1"});
    EXPECT_EQ(user(L"${prop.nosuch}", props.list), (Outcome{false, L"${prop.nosuch}"}));
    EXPECT_EQ(user(L"${}", props.list), (Outcome{false, L"${}"}));
    EXPECT_EQ(user(L"a${rcp.home}b", props.list), (Outcome{false, L"a${rcp.home}b"}));
    EXPECT_EQ(user(L"${prop.a}-${prop.nosuch}-${prop.a}", props.list),
              (Outcome{false, L"1-${prop.nosuch}-1"}));
}

TEST(replaceUserPlaceholders, EnvironmentAndDefaults)
{
    setenv("VELMORA_T", "${prop.a}", 1);
    const OwnList props({L"a", L"1"});
    EXPECT_EQ(user(L"${env.VELMORA_T}", props.list), (Outcome{true, L"1"}));
    EXPECT_EQ(user(L"${env.VELMORA_NO,dflt}", props.list), (Outcome{true, L"dflt"}));
    EXPECT_EQ(user(L"${env.VELMORA_NO}", props.list), (Outcome{false, L"${env.VELMORA_NO}"}));
}

TEST(replaceUserPlaceholders, GoesFromTheEndToTheStart)
{
    const OwnList props({L"a", L"1", L"b", L"2"});
    EXPECT_EQ(logOf(true, [&] { user(L"${prop.a}${prop.b}", props.list); }),
              "QVMRL0071I: Modified prop_contents ${prop.a}${prop.b} => ${prop.a}2\n"
              "QVMRL0071I: Modified prop_contents ${prop.a}2 => 12\n");
}

TEST(replaceUserPlaceholders, TracesThePlaceholderThatStays)
{
    EXPECT_EQ(logOf(true, [] { user(L"a${x}b", PropertyList()); }),
              "QVMRL0071I: Modified prop_contents a${x}b => a${x}b\n");
    EXPECT_EQ(logOf(false, [] { user(L"a${x}b", PropertyList()); }), "");
}

TEST(replaceUserPlaceholders, EmptyValueAtTheStart)
{
    const OwnList props({L"e", L"", L"a", L"1"});
    EXPECT_EQ(user(L"${prop.e}", props.list), (Outcome{true, L""}));
    EXPECT_EQ(user(L"${prop.e}x${prop.a}", props.list), (Outcome{true, L"x1"}));
    EXPECT_EQ(user(L"x${prop.e}", props.list), (Outcome{true, L"x"}));
}

TEST(replaceUserPlaceholders, UnclosedOneLosesItsLastCharacter)
{
    const OwnList props({L"a", L"1", L"ab", L"2"});
    EXPECT_EQ(user(L"${prop.ab", props.list), (Outcome{true, L"1"}));
    EXPECT_EQ(user(L"x${prop.n", props.list), (Outcome{false, L"x${prop.}"}));
    EXPECT_EQ(user(L"${", props.list), (Outcome{false, L"${}"}));
}

TEST(replaceUserPlaceholders, ValuesMeetTheTextAroundThem)
{
    const OwnList props({L"open", L"${prop", L"dollar", L"$", L"a", L"1"});
    // A bracket behind the value is not looked at: the placeholder ends where the search began.
    EXPECT_EQ(user(L"${prop.open}.a}", props.list), (Outcome{false, L"${pro}.a}"}));
    // A "$" that meets a bracket is a placeholder of one character.
    EXPECT_EQ(user(L"${prop.dollar}{prop.a}", props.list), (Outcome{false, L"${}{prop.a}"}));
}

TEST(replaceUserPlaceholders, TheyDoNotNest)
{
    const OwnList props({L"a", L"1", L"name", L"prop.a"});
    // The inner value is put in; the search goes on at its end, before the outer bracket, so the
    // outer one is unclosed: it loses the "a", the "1" is lost as the default's only character.
    EXPECT_EQ(user(L"${${prop.name}}", props.list), (Outcome{false, L"${prop.}}"}));
    EXPECT_EQ(user(L"${env.VELMORA_NO,${prop.a}}", props.list), (Outcome{true, L"}"}));
}

TEST(replaceUserPlaceholders, OneThatBringsItselfInAgainFailsAtTheTenthTime)
{
    const OwnList props({L"c", L"${prop.c}", L"g", L"-${prop.g}"});
    EXPECT_EQ(user(L"${prop.c}", props.list), (Outcome{false, L"${prop.c}"}));
    // The first replacement is no repetition; the tenth repetition is the eleventh replacement.
    EXPECT_EQ(user(L"${prop.g}", props.list), (Outcome{false, L"-----------${prop.g}"}));
    EXPECT_EQ(user(L"a${prop.g}b", props.list), (Outcome{false, L"a-----------${prop.g}b"}));
}

// Properties p1 to pN: each but the last brings the next one in.
static OwnList* chain(size_t length)
{
    auto* props = new OwnList({});
    for (size_t i = 1; i < length; ++i)
        appendProperty(props->list, L"p" + std::to_wstring(i),
                       L"${prop.p" + std::to_wstring(i + 1) + L"}");
    appendProperty(props->list, L"p" + std::to_wstring(length), L"end");
    return props;
}

TEST(replaceUserPlaceholders, NineRepetitionsInARowAreAllowed)
{
    const std::unique_ptr<OwnList> ten(chain(10));
    EXPECT_EQ(user(L"${prop.p1}", ten->list), (Outcome{true, L"end"}));
    const std::unique_ptr<OwnList> eleven(chain(11));
    // The tenth repetition puts its value in, and is one too many.
    EXPECT_EQ(user(L"${prop.p1}", eleven->list), (Outcome{false, L"end"}));
}

TEST(replaceUserPlaceholders, StepTowardsTheStartBeginsTheCountAnew)
{
    const std::unique_ptr<OwnList> ten(chain(10));
    EXPECT_EQ(user(L"${prop.p1}${prop.p1}${prop.p1}", ten->list), (Outcome{true, L"endendend"}));
}

TEST(replaceUserPlaceholders, ValueThatBringsItselfInBesideAnotherFails)
{
    // Each round puts in "${prop.d}${prop.a}" (18 characters, counted as 19) and the value of a,
    // and begins the count of repetitions again. 2^20 = 1048576 may be brought in like this; the
    // very first value is free.
    const OwnList empty({L"d", L"${prop.d}${prop.a}", L"a", L""});
    // 52428 rounds of 1 + 19 leave 16: 1 for the a, and then 15 are too few for the other.
    EXPECT_EQ(user(L"${prop.d}", empty.list), (Outcome{false, L"${prop.d}${prop.a}"}));
    const OwnList growing({L"d", L"${prop.d}${prop.a}", L"a", L"1"});
    // 49932 rounds of 2 + 19 leave 4: 2 for the next a, and then 2 are too few for the other.
    EXPECT_EQ(user(L"${prop.d}", growing.list),
              (Outcome{false, L"${prop.d}${prop.a}" + std::wstring(49933, L'1')}));
}

TEST(replaceUserPlaceholders, ValueWithManyPlaceholdersIsNoRepetition)
{
    const OwnList props({L"a", L"1", L"many",
                         L"${prop.a}${prop.a}${prop.a}${prop.a}${prop.a}${prop.a}"
                         L"${prop.a}${prop.a}${prop.a}${prop.a}${prop.a}${prop.a}"});
    EXPECT_EQ(user(L"${prop.many}", props.list), (Outcome{true, L"111111111111"}));
}

TEST(replaceUserPlaceholders, FromTheFirstFailureOnValuesAreNotSearchedAgain)
{
    const OwnList props({L"a", L"1", L"b", L"${prop.a}2"});
    EXPECT_EQ(user(L"${prop.b}${no}${prop.b}", props.list), (Outcome{false, L"${prop.a}2${no}12"}));
    EXPECT_EQ(user(L"x${prop.b}y${prop.b}${no}", props.list),
              (Outcome{false, L"x${prop.a}2y${prop.a}2${no}"}));
}

TEST(replaceUserPlaceholders, FailureAtTheStartEnds)
{
    EXPECT_EQ(logOf(true, [] { user(L"${no}", PropertyList()); }),
              "QVMRL0071I: Modified prop_contents ${no} => ${no}\n");
}

TEST(replaceAllPlaceholders, StandardOnesFirst)
{
    const OwnList props({L"/rcp", L"1", L"h", L"${rcp.home}"});
    EXPECT_EQ(all(L"${prop.${rcp.home}}${rcp.data}", props.list), (Outcome{true, L"1/ws"}));
    EXPECT_EQ(all(L"${rcp.home}", props.list), (Outcome{true, L"/rcp"}));
}

TEST(replaceAllPlaceholders, TellsWhetherAnythingChanged)
{
    const OwnList props({L"a", L"1"});
    EXPECT_EQ(all(L"x", props.list), (Outcome{false, L"x"}));
    EXPECT_EQ(all(L"", props.list), (Outcome{false, L""}));
    EXPECT_EQ(all(L"${prop.a}", props.list), (Outcome{true, L"1"}));
    EXPECT_EQ(all(L"${rcp.data}", PropertyList()), (Outcome{true, L"/ws"}));
}

TEST(replaceAllPlaceholders, EndsWithThePartlyResolvedText)
{
    const OwnList props({L"a", L"1", L"h", L"${rcp.home}"});
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EINVAL;
            all(L"${prop.a}${rcp.data}${prop.no}${prop.a}", props.list);
        },
        "QVMRL0088E: property substitution is invalid (1/ws${prop.no}1)", EINVAL));
    // What a user placeholder brings in is never a standard one.
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EINVAL;
            all(L"${prop.h}", props.list);
        },
        "QVMRL0088E: property substitution is invalid (${rcp.home})", EINVAL));
}

TEST(replaceAllPlaceholders, EndsWhenOneBringsItselfIn)
{
    const OwnList props({L"c", L"${prop.c}"});
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EINVAL;
            all(L"${prop.c}", props.list);
        },
        "QVMRL0088E: property substitution is invalid (${prop.c})", EINVAL));
}

TEST(replacePlaceholdersInVmargMap, EveryValueAndNoKey)
{
    const OwnList props({L"a", L"1", L"b", L"${prop.a}2"});
    VmargMap map = {{L"vmarg.${rcp.home}", L"-D${prop.b}"},
                    {L"vmarg.b", L"${rcp.home}|${rcp.data}|${workspace.location}"},
                    {L"vmarg.c", L"plain"},
                    {L"vmarg.d", L""}};
    replacePlaceholdersInVmargMap(L"C:\\ws", L"C:\\rcp", props.list, map);
    EXPECT_EQ(map, (VmargMap{{L"vmarg.${rcp.home}", L"-D12"},
                             {L"vmarg.b", L"C:/rcp|C:/ws|C:/ws"},
                             {L"vmarg.c", L"plain"},
                             {L"vmarg.d", L""}}));
}

TEST(replacePlaceholdersInVmargMap, NothingWithoutProperties)
{
    VmargMap map = {{L"vmarg.a", L"${rcp.home}${prop.no}"}};
    replacePlaceholdersInVmargMap(L"/ws", L"/rcp", PropertyList(), map);
    EXPECT_EQ(map, (VmargMap{{L"vmarg.a", L"${rcp.home}${prop.no}"}}));
}

TEST(replacePlaceholdersInVmargMap, EndsAtTheFirstKeyThatFails)
{
    const OwnList props({L"a", L"1"});
    VmargMap map = {{L"vmarg.z", L"${prop.z}"}, {L"vmarg.y", L"${prop.y}"}, {L"vmarg.x", L"x"}};
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EINVAL;
            replacePlaceholdersInVmargMap(L"/ws", L"/rcp", props.list, map);
        },
        "QVMRL0088E: property substitution is invalid (${prop.y})", EINVAL));
}

TEST(replacePlaceholdersInRcpInstallProp, EveryValueAndNoKey)
{
    OwnList props({L"${rcp.home}", L"${rcp.home}\\x", L"b", L"${workspace.location}:${rcp.data}",
                   L"c", L"plain", L"d", L""});
    replacePlaceholdersInRcpInstallProp(L"C:\\ws", L"C:\\rcp", props.list);
    EXPECT_EQ(texts(props.list), Texts({L"${rcp.home}", L"C:/rcp\\x", L"b", L"C:/ws:C:/ws", L"c",
                                        L"plain", L"d", L""}));
}

TEST(replacePlaceholdersInRcpInstallProp, LaterValuesSeeEarlierOnesResolved)
{
    OwnList props(
        {L"a", L"${rcp.home}", L"b", L"${prop.a}/b", L"c", L"${prop.b}${prop.d}", L"d", L"4"});
    replacePlaceholdersInRcpInstallProp(L"/ws", L"/rcp", props.list);
    EXPECT_EQ(texts(props.list),
              Texts({L"a", L"/rcp", L"b", L"/rcp/b", L"c", L"/rcp/b4", L"d", L"4"}));
}

TEST(replacePlaceholdersInRcpInstallProp, EarlierValuesSeeLaterOnesAsTheyStand)
{
    OwnList props({L"a", L"${prop.b}", L"b", L"${rcp.home}"});
    EXPECT_TRUE(endsWith(
        [&] {
            errno = EINVAL;
            replacePlaceholdersInRcpInstallProp(L"/ws", L"/rcp", props.list);
        },
        "QVMRL0088E: property substitution is invalid (${rcp.home})", EINVAL));
}

TEST(replacePlaceholdersInRcpInstallProp, UnchangedValuesKeepTheirBlock)
{
    OwnList props({L"a", L"plain", L"b", L"${rcp.home}"});
    const wchar_t* plain = props.list[1];
    const wchar_t* key = props.list[2];
    replacePlaceholdersInRcpInstallProp(L"/ws", L"/rcp", props.list);
    EXPECT_EQ(props.list[1], plain);
    EXPECT_EQ(props.list[2], key);
}

TEST(replacePlaceholdersInRcpInstallProp, EmptyListStaysEmpty)
{
    PropertyList props;
    replacePlaceholdersInRcpInstallProp(L"/ws", L"/rcp", props);
    EXPECT_TRUE(props.empty());
}

TEST(replacePlaceholdersInArgv, StandardOnesInBothArrays)
{
    wchar_t plain[] = L"plain";
    wchar_t data[] = L"${rcp.data}/${rcp.home}";
    wchar_t location[] = L"${workspace.location}";
    wchar_t property[] = L"${prop.a}";
    wchar_t* words[] = {plain, data, location, property};
    wchar_t* changed[] = {nullptr, nullptr, nullptr, nullptr};
    wchar_t** argv = words;
    wchar_t** changes = changed;
    replacePlaceholdersInArgv(L"C:\\ws", L"C:\\rcp", &argv, &changes, 4);
    EXPECT_EQ(Texts(words, words + 4), Texts({L"plain", L"C:/ws/C:/rcp", L"C:/ws", L"${prop.a}"}));
    EXPECT_EQ(Texts(changed, changed + 4), Texts({L"", L"C:/ws/C:/rcp", L"C:/ws", L""}));
    EXPECT_EQ(words[1], changed[1]);
    EXPECT_EQ(words[2], changed[2]);
    free(words[1]);
    free(words[2]);
}

TEST(replacePlaceholdersInArgv, UnchangedWordsAreLeftAlone)
{
    wchar_t plain[] = L"C:\\x";
    wchar_t* words[] = {plain};
    wchar_t* changed[] = {nullptr};
    wchar_t** argv = words;
    wchar_t** changes = changed;
    replacePlaceholdersInArgv(L"/ws", L"/rcp", &argv, &changes, 1);
    EXPECT_EQ(words[0], plain);
    EXPECT_STREQ(plain, L"C:\\x");
    EXPECT_STREQ(changed[0], L"");
}

TEST(replacePlaceholdersInArgv, WordsBehindTheCountAreNotTouched)
{
    wchar_t data[] = L"${rcp.data}";
    wchar_t mark[] = L"mark";
    wchar_t* words[] = {data};
    wchar_t* changed[] = {mark};
    wchar_t** argv = words;
    wchar_t** changes = changed;
    replacePlaceholdersInArgv(L"/ws", L"/rcp", &argv, &changes, 0);
    EXPECT_EQ(words[0], data);
    EXPECT_EQ(changed[0], mark);
}

TEST(fixUpJvmLibPath, OneEntry)
{
    EXPECT_EQ(fixedUp(L"lib"), HOME + L"/lib");
    EXPECT_EQ(fixedUp(L"lib\\i386"), HOME + L"/lib/i386");
    EXPECT_EQ(fixedUp(L"ab"), HOME + L"/ab");
}

TEST(fixUpJvmLibPath, EntryThatHoldsTheHomeStays)
{
    EXPECT_EQ(fixedUp(L"${prop.java.home}/bin"), HOME + L"/bin");
    EXPECT_EQ(fixedUp(L"/x/${prop.java.home}\\bin"), L"/x/" + HOME + L"/bin");
    EXPECT_EQ(fixedUp(L"${prop.Java.home}"), HOME + L"/${prop.Java.home}");
}

TEST(fixUpJvmLibPath, EntryOfOneCharacterIsDropped)
{
    EXPECT_EQ(fixedUp(L"a"), L"");
    EXPECT_EQ(fixedUp(L"a:bc"), HOME + L"/bc");
    EXPECT_EQ(fixedUp(L"bc:a"), HOME + L"/bc:");
}

TEST(fixUpJvmLibPath, EmptyEntryIsTheHome)
{
    EXPECT_EQ(fixedUp(L""), HOME + L"/:");
    EXPECT_EQ(fixedUp(L":"), HOME + L"/");
    // The colon of the first entry stands before the last place, so it stays; the next start is 1.
    EXPECT_EQ(fixedUp(L":bc"), HOME + L"/:" + HOME + L"/bc");
}

TEST(fixUpJvmLibPath, LastColonGoes)
{
    EXPECT_EQ(fixedUp(L"lib:"), HOME + L"/lib");
    EXPECT_EQ(fixedUp(L"lib:x:"), HOME + L"/lib:");
}

TEST(fixUpJvmLibPath, TwoEntries)
{
    EXPECT_EQ(fixedUp(L"ab:cd"), HOME + L"/ab:" + HOME + L"/cd");
    EXPECT_EQ(fixedUp(L"${prop.java.home}/a:cd"), HOME + L"/a:" + HOME + L"/cd");
}

TEST(fixUpJvmLibPath, FromTheSecondEntryOnTheScanSkipsAhead)
{
    // Starts: 0, 0+2+1 = 3, 3+5+1 = 9, which is behind the end (8).
    EXPECT_EQ(fixedUp(L"ab:cd:ef"), HOME + L"/ab:" + HOME + L"/cd:");
    // Starts: 0, 3, 9, 9+11+1 = 21: "ef" is skipped, and so is what follows "gh".
    EXPECT_EQ(fixedUp(L"ab:cd:ef:gh:ijklm"), HOME + L"/ab:" + HOME + L"/cd:" + HOME + L"/gh:");
    // Starts: 0, 3, 3+6+1 = 10: from inside "efghij".
    EXPECT_EQ(fixedUp(L"ab:cde:efghij"), HOME + L"/ab:" + HOME + L"/cde:" + HOME + L"/hij");
    // Starts: 0, 3, 10, at the last character, which is alone.
    EXPECT_EQ(fixedUp(L"ab:cde:efgh"), HOME + L"/ab:" + HOME + L"/cde:");
}

// ---- The same, step by step ---------------------------------------------------------------------
// The launcher sets aside what is done, to be fast with long values. These models do what is
// promised in the plainest way, on one text with positions in it.

static Position modelOfFindLast(const std::wstring& s, Position pos, Position& length,
                                std::wstring& name)
{
    Position start = NONE;
    for (Position i = 0; i + 1 < s.size() && i <= pos; ++i) {
        if (s[i] == L'$' && s[i + 1] == L'{')
            start = i;
    }
    if (start == NONE)
        return NONE;
    Position end = start;
    while (end < s.size() && s[end] != L'}')
        ++end;
    if (end == s.size() || end > pos)
        end = pos;
    length = end - start + 1;
    name = length > 2 ? s.substr(start + 2, length - 3) : std::wstring();
    return start;
}

static bool modelOfValue(std::wstring name, std::wstring& value, const PropertyList& props)
{
    const std::wstring whole = name;
    if (name.substr(0, 4) == L"env.") {
        const Position comma = name.find(L',');
        if (comma != NONE)
            name.resize(comma);
        // The variables of these tests are plain.
        const std::string variable(name.begin() + 4, name.end());
        const char* set = getenv(variable.c_str());
        if (set != nullptr) {
            const std::string bytes = set;
            value.assign(bytes.begin(), bytes.end());
            return true;
        }
        if (comma != NONE) {
            value = whole.substr(comma + 1);
            return true;
        }
    }
    if (name.substr(0, 5) == L"prop.") {
        for (size_t i = 0; i + 1 < props.size(); i += 2) {
            if (name.substr(5) == props[i]) {
                value = props[i + 1];
                return true;
            }
        }
    }
    value = L"${" + whole + L"}";
    return false;
}

// What a model can say of a text, when it does not go on for too long.
enum Ending { SUCCESS, FAILURE, TOO_LONG };

static Ending modelOfReplaceUser(std::wstring& s, const PropertyList& props)
{
    Position pos = s.size() - 1;
    Position lastStart = NONE;
    bool ok = true;
    int repeats = 0;
    for (int left = 1000; left > 0; --left) {
        Position length = 0;
        std::wstring name;
        const Position start = modelOfFindLast(s, pos, length, name);
        if (start == NONE)
            return ok ? SUCCESS : FAILURE;
        std::wstring value;
        if (!modelOfValue(name, value, props))
            ok = false;
        s = s.substr(0, start) + value + s.substr(start + length);
        pos = start + value.size() - 1;
        if (lastStart != NONE && start >= lastStart) {
            ++repeats;
            if (repeats > 9)
                return FAILURE;
        } else {
            repeats = 0;
        }
        if (!ok) {
            if (start == 0)
                return FAILURE;
            pos = start - 1;
        }
        lastStart = start;
    }
    return TOO_LONG;
}

// Gives up, with false, after so many replacements.
static bool modelOfReplaceOne(const std::wstring& placeholder, const std::wstring& value,
                              std::wstring& s, bool& replaced)
{
    for (int left = 200; left > 0; --left) {
        const Position found = s.find(placeholder);
        if (found == NONE)
            return true;
        s = s.substr(0, found) + value + s.substr(found + placeholder.size());
        replaced = true;
    }
    return false;
}

static bool modelOfReplaceStandard(const std::wstring& workspace, const std::wstring& rcpHome,
                                   std::wstring& s, bool& replaced)
{
    return modelOfReplaceOne(L"${rcp.home}", rcpHome, s, replaced) &&
           modelOfReplaceOne(L"${workspace.location}", workspace, s, replaced) &&
           modelOfReplaceOne(L"${rcp.data}", workspace, s, replaced);
}

// Texts made of pieces, the same in every run.
struct Pieces {
    explicit Pieces(Texts allPieces) : pieces(std::move(allPieces)) {}

    std::wstring text(size_t most)
    {
        std::wstring s;
        for (size_t left = random() % (most + 1); left > 0; --left)
            s += pieces[random() % pieces.size()];
        return s;
    }

    Texts pieces;
    std::mt19937 random{20131002};
};

static const Texts USER_PIECES = {
    L"$",         L"{",       L"}",         L"${",        L"p",         L"prop.",
    L"prop.a",    L"prop.b}", L"${prop.a}", L"${prop.b}", L"${prop.c}", L"${prop.d}",
    L",",         L"env.",    L"env.VT",    L"${env.VN,", L"${env.VT}", L"${env.VE}",
    L"${env.VN}", L"a",       L"${}",       L"$$",        L"x",         L"${prop.no}"};

TEST(replaceUserPlaceholders, DoesWhatTheModelDoes)
{
    setenv("VT", "t${prop.a}", 1);
    setenv("VE", "", 1);
    unsetenv("VN");
    Pieces pieces(USER_PIECES);
    int failed = 0;
    int resolved = 0;
    int compared = 0;
    for (int i = 0; i < 4000; ++i) {
        OwnList props({});
        for (const wchar_t* key : {L"a", L"b", L"c", L"d", L"", L"a${prop"}) {
            if (pieces.random() % 6 != 0)
                appendProperty(props.list, key, pieces.random() % 5 == 0 ? L"1" : pieces.text(3));
        }
        for (int j = 0; j < 100; ++j) {
            const std::wstring text = pieces.text(9);
            Outcome wanted{false, text};
            const Ending ending = modelOfReplaceUser(wanted.text, props.list);
            if (ending == TOO_LONG)
                continue;
            wanted.result = ending == SUCCESS;
            ASSERT_EQ(user(text, props.list), wanted) << testing::PrintToString(text) << " with "
                                                      << testing::PrintToString(texts(props.list));
            ++compared;
            if (!wanted.result)
                ++failed;
            else if (wanted.text != text)
                ++resolved;
        }
    }
    // Both ends are reached often, and few texts go on for too long.
    EXPECT_GT(failed, 100000);
    EXPECT_GT(resolved, 20000);
    EXPECT_GT(compared, 390000);
}

TEST(replaceUserPlaceholders, TracesWhatTheModelDoes)
{
    const OwnList props({L"a", L"$", L"b", L"x${prop.a}"});
    EXPECT_EQ(logOf(true, [&] { user(L"-${prop.b}{c}${prop.a}", props.list); }),
              "QVMRL0071I: Modified prop_contents -${prop.b}{c}${prop.a} => -${prop.b}{c}$\n"
              "QVMRL0071I: Modified prop_contents -${prop.b}{c}$ => -x${prop.a}{c}$\n"
              "QVMRL0071I: Modified prop_contents -x${prop.a}{c}$ => -x${c}$\n"
              "QVMRL0071I: Modified prop_contents -x${c}$ => -x${}{c}$\n");
}

TEST(findLastPlaceholder, DoesWhatTheModelDoes)
{
    Pieces pieces(USER_PIECES);
    for (int i = 0; i < 100000; ++i) {
        const std::wstring s = pieces.text(6);
        const Position pos = pieces.random() % (s.size() + 3) - 1;
        Position length = 77;
        Position wantedLength = 77;
        std::wstring name = L"before";
        std::wstring wantedName = L"before";
        // Beyond the text a search goes as far as the text; an unclosed one there has no end.
        if (pos >= s.size())
            continue;
        const Position wanted = modelOfFindLast(s, pos, wantedLength, wantedName);
        ASSERT_EQ(findLastPlaceholder(s, pos, length, name), wanted) << testing::PrintToString(s);
        ASSERT_EQ(length, wantedLength) << testing::PrintToString(s);
        ASSERT_EQ(name, wantedName) << testing::PrintToString(s);
    }
}

static const Texts STANDARD_PIECES = {
    L"$",           L"${",       L"${rcp.",     L"home}", L"rcp.home}", L"${rcp.home}",
    L"${rcp.data}", L"${rcp.da", L"ta}",        L"}",     L"{",         L"${workspace.",
    L"location}",   L"x",        L"${rcp.home", L"h",     L"/",         L"${workspace.location}"};

TEST(replaceStdPlaceholders, DoesWhatTheModelDoes)
{
    Pieces pieces(STANDARD_PIECES);
    int compared = 0;
    for (int i = 0; i < 300000; ++i) {
        const std::wstring workspace = pieces.text(3);
        const std::wstring rcpHome = pieces.text(3);
        // These end the process when their placeholder is there.
        if (rcpHome.find(L"${rcp.home}") != NONE ||
            workspace.find(L"${workspace.location}") != NONE ||
            workspace.find(L"${rcp.data}") != NONE)
            continue;
        const std::wstring text = pieces.text(8);
        Outcome wanted{false, text};
        if (!modelOfReplaceStandard(workspace, rcpHome, wanted.text, wanted.result))
            continue;
        Outcome outcome{false, text};
        outcome.result = replaceStdPlaceholders(workspace, rcpHome, outcome.text);
        ASSERT_EQ(outcome, wanted) << testing::PrintToString(Texts({text, workspace, rcpHome}));
        ++compared;
    }
    EXPECT_GT(compared, 200000);
}
