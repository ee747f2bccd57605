#include "launcher/properties/property_file.h"

#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <cerrno>
#include <sys/stat.h>
#include <unistd.h>

typedef std::vector<std::wstring> Texts;

// The texts of the list that the reader makes of a file with these bytes.
static Texts read(const std::string& fileBytes)
{
    PropertyList list = properties(fileBytes);
    Texts out = texts(list);
    freeProperties(list);
    return out;
}

static std::string bytes(size_t count, char c)
{
    return std::string(count, c);
}

static std::wstring wide(size_t count, wchar_t c)
{
    return std::wstring(count, c);
}

TEST(getProperties, KeyAndValueInFileOrder)
{
    EXPECT_EQ(read("rcp.home=/opt/app\nb=2\na=1\n"),
              Texts({L"rcp.home", L"/opt/app", L"b", L"2", L"a", L"1"}));
}

TEST(getProperties, DuplicatesStay)
{
    EXPECT_EQ(read("a=1\na=2\na=1\n"), Texts({L"a", L"1", L"a", L"2", L"a", L"1"}));
}

TEST(getProperties, AppendsToTheList)
{
    TempDir dir;
    dir.write("first", "a=1\n");
    dir.write("second", "a=2\nb=3");
    PropertyList list;
    getProperties(dir.wide("first"), list);
    getProperties(dir.wide("second"), list);
    EXPECT_EQ(texts(list), Texts({L"a", L"1", L"a", L"2", L"b", L"3"}));
    freeProperties(list);
}

TEST(getProperties, LastLineNeedsNoEnd)
{
    EXPECT_EQ(read("a=1\nb=2"), Texts({L"a", L"1", L"b", L"2"}));
    EXPECT_EQ(read("a"), Texts({L"a", L""}));
}

TEST(getProperties, EqualsSignColonBlankAndTabSeparate)
{
    EXPECT_EQ(read("key=value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("key:value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("key value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("key\tvalue\n"), Texts({L"key", L"value"}));
}

TEST(getProperties, RunOfSeparatorsIsSwallowed)
{
    EXPECT_EQ(read("key = value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("key==value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("key \t:=\t: value\n"), Texts({L"key", L"value"}));
    EXPECT_EQ(read("  vmarg.Xmx : -Xmx512m  \n"), Texts({L"vmarg.Xmx", L"-Xmx512m"}));
}

TEST(getProperties, SeparatorsInsideAValueStay)
{
    EXPECT_EQ(read("name value with spaces\n"), Texts({L"name", L"value with spaces"}));
    EXPECT_EQ(read("a=b=c:d\te\n"), Texts({L"a", L"b=c:d\te"}));
    EXPECT_EQ(read("a = b = c\n"), Texts({L"a", L"b = c"}));
}

TEST(getProperties, ValueMayBeMissing)
{
    EXPECT_EQ(read("empty=\n"), Texts({L"empty", L""}));
    EXPECT_EQ(read("empty\n"), Texts({L"empty", L""}));
    EXPECT_EQ(read("empty = : \n"), Texts({L"empty", L""}));
}

TEST(getProperties, KeyMayBeMissing)
{
    EXPECT_EQ(read("=v\n"), Texts({L"", L"v"}));
    EXPECT_EQ(read("a=1\n: v\n"), Texts({L"a", L"1", L"", L"v"}));
}

TEST(getProperties, ValuesAreUnescapedAndTrimmed)
{
    EXPECT_EQ(read("path=C:\\\\dir\\\\sub\n"), Texts({L"path", L"C:\\dir\\sub"}));
    EXPECT_EQ(read("a=\\u0041\\t\\n \n"), Texts({L"a", L"Atn"}));
    EXPECT_EQ(read("a=b\\u0020\\u0020\n"), Texts({L"a", L"b"}));
    EXPECT_EQ(read("a=\\u0020b\n"), Texts({L"a", L"b"}));
}

TEST(getProperties, EscapedZeroCutsTheValue)
{
    EXPECT_EQ(read("a=b\\u0000c\nd=e\n"), Texts({L"a", L"b", L"d", L"e"}));
}

TEST(getProperties, KeysHaveNoEscapes)
{
    EXPECT_EQ(read("a\\tb\\u0041\\\\c=d\n"), Texts({L"a\\tb\\u0041\\\\c", L"d"}));
}

TEST(getProperties, CharacterBehindABackslashIsNotShielded)
{
    EXPECT_EQ(read("key=\\=x\n"), Texts({L"key", L"x"}));
    EXPECT_EQ(read("key\\ =x\n"), Texts({L"key", L"x"}));
    EXPECT_EQ(read("key\\:x\n"), Texts({L"key", L"x"}));
    EXPECT_EQ(read("key\\=x\n"), Texts({L"key", L"x"}));
    EXPECT_EQ(read("key=\\ \\:\\ x\n"), Texts({L"key", L"x"}));
}

TEST(getProperties, BackslashGoesBeforeASeparatorInsideAValue)
{
    EXPECT_EQ(read("key=a\\=x\n"), Texts({L"key", L"a=x"}));
    EXPECT_EQ(read("key=a\\:b\\ c\\#d\n"), Texts({L"key", L"a:b c#d"}));
    EXPECT_EQ(read("key=a\\ \n"), Texts({L"key", L"a"}));
}

TEST(getProperties, BackslashGoesBeforeANumberSignInAKey)
{
    EXPECT_EQ(read("\\#a\\#b=c\n"), Texts({L"#a#b", L"c"}));
    EXPECT_EQ(read("a=\\#b\n"), Texts({L"a", L"#b"}));
}

TEST(getProperties, DoubledBackslashShieldsNothingInAKey)
{
    // The first one is a character of the key, the second stands before the separator.
    EXPECT_EQ(read("a\\\\=b\n"), Texts({L"a\\", L"b"}));
}

TEST(getProperties, DoubledBackslashIsOneInAValue)
{
    EXPECT_EQ(read("a=b\\\\:c\n"), Texts({L"a", L"b\\:c"}));
    EXPECT_EQ(read("a=b\\\\u0041\n"), Texts({L"a", L"b\\u0041"}));
    EXPECT_EQ(read("a=b\\\\\n"), Texts({L"a", L"b\\"}));
}

TEST(getProperties, CommentsGiveNothing)
{
    EXPECT_EQ(read("# comment\n   # indented comment\n#\n\t#a=b\n"), Texts());
    EXPECT_EQ(read("#a\\\nb=1\n"), Texts({L"b", L"1"}));
}

TEST(getProperties, ExclamationMarkBeginsAKey)
{
    EXPECT_EQ(read("!key=v\n"), Texts({L"!key", L"v"}));
}

TEST(getProperties, NumberSignBehindTheStartIsACharacter)
{
    EXPECT_EQ(read("a#b=c#d\n"), Texts({L"a#b", L"c#d"}));
    EXPECT_EQ(read("a= #d\n"), Texts({L"a", L"#d"}));
}

TEST(getProperties, FileWithoutPropertiesAppendsNothing)
{
    EXPECT_EQ(read(""), Texts());
    EXPECT_EQ(read("\n\n  \n\t\n"), Texts());
    EXPECT_EQ(read("\n# a\n\n# b"), Texts());
}

TEST(getProperties, LeadingWhiteSpaceAndEmptyLinesAreSkipped)
{
    EXPECT_EQ(read("\n\r\n \t\v\f a=1\n\n   \n\t b=2\n\n"), Texts({L"a", L"1", L"b", L"2"}));
}

TEST(getProperties, CarriageReturnBelongsToTheLine)
{
    EXPECT_EQ(read("a=1\r\nb\r\n"), Texts({L"a", L"1\r", L"b\r", L""}));
}

TEST(getProperties, OnlySpacesAreTrimmed)
{
    EXPECT_EQ(read("a=b\t \n"), Texts({L"a", L"b\t"}));
}

TEST(getProperties, LastBackslashContinuesTheProperty)
{
    EXPECT_EQ(read("list=a,\\\n    b\n"), Texts({L"list", L"a,b"}));
    EXPECT_EQ(read("list=a,\\\nb,\\\nc\nd=1\n"), Texts({L"list", L"a,b,c", L"d", L"1"}));
}

TEST(getProperties, OddNumberOfBackslashesContinues)
{
    EXPECT_EQ(read("a=b\\\\\nc=d\n"), Texts({L"a", L"b\\", L"c", L"d"}));
    EXPECT_EQ(read("a=b\\\\\\\nc=d\n"), Texts({L"a", L"b\\c=d"}));
}

TEST(getProperties, KeyMayBeContinued)
{
    EXPECT_EQ(read("ab\\\ncd=e\\\nf\n"), Texts({L"abcd", L"ef"}));
}

TEST(getProperties, SeparatorsAtTheHeadOfAContinuationAreSwallowed)
{
    EXPECT_EQ(read("a=b\\\n=:c=d\n"), Texts({L"a", L"bc=d"}));
    EXPECT_EQ(read("a\\\n=b\n"), Texts({L"a", L"b"}));
}

TEST(getProperties, CommentsAndEmptyLinesDoNotEndAContinuation)
{
    EXPECT_EQ(read("a=b\\\n# c\n\n  #d\\\ne\nf=1\n"), Texts({L"a", L"be", L"f", L"1"}));
}

TEST(getProperties, ContinuesUntilACharacterOfTheValueHasCome)
{
    EXPECT_EQ(read("a\\\nb\nc=d\n"), Texts({L"abc", L"d"}));
    EXPECT_EQ(read("a\\\n=\nx\ny=1\n"), Texts({L"a", L"x", L"y", L"1"}));
    EXPECT_EQ(read("a=b\\\n=\nc\n"), Texts({L"a", L"bc"}));
}

TEST(getProperties, ContinuationIsOverWithACharacterOfTheValue)
{
    EXPECT_EQ(read("a=\\\nb\nc=d\n"), Texts({L"a", L"b", L"c", L"d"}));
}

TEST(getProperties, PropertyThatContinuesAtTheEndIsNeverFinished)
{
    EXPECT_EQ(read("a=1\nb=2\\"), Texts({L"a", L"1"}));
    EXPECT_EQ(read("a=1\nb=2\\\n"), Texts({L"a", L"1"}));
    EXPECT_EQ(read("a\\\nb\n"), Texts());
    EXPECT_EQ(read("\\\n"), Texts());
}

TEST(getProperties, NothingIsLeftForTheNextFile)
{
    TempDir dir;
    dir.write("first", "-Xa\\\n");
    dir.write("second", "b=2\n");
    PropertyList list;
    getProperties(dir.wide("first"), list);
    getProperties(dir.wide("second"), list);
    EXPECT_EQ(texts(list), Texts({L"b", L"2"}));
    freeProperties(list);
}

TEST(getProperties, XLineGivesItselfBack)
{
    EXPECT_EQ(read("-Xmx256m\n"), Texts({L"-Xmx256m", L""}));
    EXPECT_EQ(read("-Xshareclasses:name=rcp\n"), Texts({L"-Xshareclasses", L":name=rcp"}));
    EXPECT_EQ(read("-XX:+A=:b\n"), Texts({L"-XX", L":+A=:b"}));
    EXPECT_EQ(read("-X\n"), Texts({L"-X", L""}));
}

TEST(getProperties, XLineKeepsItsRunOfSeparators)
{
    EXPECT_EQ(read("-Xa=:\tb\n"), Texts({L"-Xa", L"=:\tb"}));
    // The value is trimmed all the same.
    EXPECT_EQ(read("-Xa = b\n"), Texts({L"-Xa", L"= b"}));
}

TEST(getProperties, XLineIsCaseSensitive)
{
    EXPECT_EQ(read("-xa:b\n"), Texts({L"-xa", L"b"}));
    EXPECT_EQ(read("a-X:b\n"), Texts({L"a-X", L"b"}));
}

TEST(getProperties, ContinuationOfAnXLineIsOneToo)
{
    EXPECT_EQ(read("-Xa:\\\n  :b\nc:d\n"), Texts({L"-Xa", L"::b", L"c", L"d"}));
    EXPECT_EQ(read("a:b\\\n-X:c\n"), Texts({L"a", L"b-X:c"}));
    // A separator that is kept is no character of the value that would end the continuing.
    EXPECT_EQ(read("-Xa\\\n=\nb\n"), Texts({L"-Xa", L"=b"}));
}

TEST(getProperties, LineOfOneCharacterLeavesTheMarkOfTheLineBefore)
{
    EXPECT_EQ(read("-Xa\n=\n"), Texts({L"-Xa", L"", L"", L"="}));
    EXPECT_EQ(read("-Xa\n=\n:\nb=\n=\n"),
              Texts({L"-Xa", L"", L"", L"=", L"", L":", L"b", L"", L"", L""}));
    EXPECT_EQ(read("=\n"), Texts({L"", L""}));
}

TEST(getProperties, EscapedSpaceNeverReachesTheKey)
{
    EXPECT_EQ(read("\\ key\\ = v\n"), Texts({L"", L"key = v"}));
}

TEST(getProperties, LineThatTheLocaleCannotConvertYieldsNoPair)
{
    EXPECT_EQ(read("a=1\nb=\xff\nc=3\n"), Texts({L"a", L"1", L"c", L"3"}));
    EXPECT_EQ(read("a=1\\\n\xff\n2\n"), Texts({L"a", L"12"}));
}

TEST(getProperties, NulByteEndsTheLine)
{
    EXPECT_EQ(read(std::string("a=b\0c\nd=1\n", 10)), Texts({L"a", L"b", L"d", L"1"}));
    EXPECT_EQ(read(std::string("\0a=b\nd=1\n", 9)), Texts({L"d", L"1"}));
    // What stands before it is the end of the line, a backslash too.
    EXPECT_EQ(read(std::string("a=b\\\0c\nd\n", 9)), Texts({L"a", L"bd"}));
}

TEST(getProperties, BytesAreTheLocales)
{
    EXPECT_EQ(read("k\xc3\xa9y=\xe2\x82\xac \xf0\x9f\x98\x80\n"),
              Texts({L"k\u00e9y", L"\u20ac \U0001f600"}));
}

TEST(getProperties, LineOf2024BytesIsOne)
{
    EXPECT_EQ(read("k=" + bytes(2022, 'x') + "\na=1\n"),
              Texts({L"k", wide(2022, L'x'), L"a", L"1"}));
}

TEST(getProperties, LineOf2025BytesIsTwo)
{
    EXPECT_EQ(read("k=" + bytes(2023, 'x') + "\na=1\n"),
              Texts({L"k", wide(2022, L'x'), L"x", L"", L"a", L"1"}));
}

TEST(getProperties, LineOf3000BytesIsTwo)
{
    EXPECT_EQ(read("k=" + bytes(2022, 'x') + "y=" + bytes(974, 'z')),
              Texts({L"k", wide(2022, L'x'), L"y", wide(974, L'z')}));
    EXPECT_EQ(read(bytes(3000, 'x')), Texts({wide(2024, L'x'), L"", wide(976, L'x'), L""}));
}

TEST(getProperties, IndentationIsNoPartOfTheLongestLine)
{
    EXPECT_EQ(read(bytes(3000, ' ') + "k=" + bytes(2022, 'x') + "\n"),
              Texts({L"k", wide(2022, L'x')}));
}

TEST(getProperties, RemainderOfALongLineIsALineLikeAnyOther)
{
    const std::string start = "k=" + bytes(2022, 'x');
    EXPECT_EQ(read(start + "#y=1\na=1\n"), Texts({L"k", wide(2022, L'x'), L"a", L"1"}));
    EXPECT_EQ(read(start + "  y=1\n"), Texts({L"k", wide(2022, L'x'), L"y", L"1"}));
}

TEST(getProperties, LimitCountsBytesNotCharacters)
{
    std::string value;
    for (int i = 0; i < 1011; ++i)
        value += "\xc3\xa9";
    EXPECT_EQ(read("k=" + value + "\n"), Texts({L"k", wide(1011, L'\u00e9')}));
    EXPECT_EQ(read("k=" + value + "\xc3\xa9\n"),
              Texts({L"k", wide(1011, L'\u00e9'), L"\u00e9", L""}));
}

TEST(getProperties, LineCutInsideACharacterYieldsNothing)
{
    const std::string line = "k=" + bytes(2021, 'x') + "\xc3\xa9y=1";
    EXPECT_EQ(read(line + "\na=1\n"), Texts({L"a", L"1"}));
}

TEST(getProperties, TracesLinesKeysAndValues)
{
    PropertyList list;
    TempDir dir;
    dir.write("a", "# c\n  a = \\u0041\\\n b \nc\n");
    EXPECT_EQ(logOf(true, [&] { getProperties(dir.wide("a"), list); }),
              "QVMRL0032I: Prop Line = \"# c\"\n"
              "QVMRL0032I: Prop Line = \"a = \\u0041\\\"\n"
              "QVMRL0032I: Prop Line = \"b \"\n"
              "QVMRL0023I:   attrib = \"a\"\n"
              "QVMRL0024I:   value  = \"Ab\"\n"
              "QVMRL0032I: Prop Line = \"c\"\n"
              "QVMRL0023I:   attrib = \"c\"\n"
              "QVMRL0024I:   value  = \"\"\n");
    freeProperties(list);
}

TEST(getProperties, SaysNothingWithoutTracing)
{
    PropertyList list;
    TempDir dir;
    dir.write("a", "a=1\n");
    EXPECT_EQ(logOf(false, [&] { getProperties(dir.wide("a"), list); }), "");
    freeProperties(list);
}

TEST(getProperties, EndsWhenTheFileIsMissing)
{
    TempDir dir;
    PropertyList list;
    EXPECT_TRUE(endsWith([&] { getProperties(dir.wide("no.properties"), list); },
                         "QVMRL0096E: Unable to load " + dir.path("no.properties") + " file!",
                         ENOENT));
}

TEST(getProperties, EndsWhenTheFileCannotBeRead)
{
    TempDir dir;
    dir.write("a", "a=1\n");
    chmod(dir.dir.c_str(), 0755);
    chmod(dir.path("a").c_str(), 0);
    PropertyList list;
    EXPECT_TRUE(endsWith(
        [&] {
            // Root reads everything.
            if (geteuid() == 0 && setresuid(65534, 65534, 65534) != 0)
                _exit(78);
            getProperties(dir.wide("a"), list);
        },
        "QVMRL0096E: Unable to load " + dir.path("a") + " file!", EACCES));
}

TEST(getProperties, DirectoryOpensAndHoldsNothing)
{
    TempDir dir;
    dir.makeDir("d");
    PropertyList list;
    getProperties(dir.wide("d"), list);
    EXPECT_TRUE(list.empty());
}
