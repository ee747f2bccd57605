#include "launcher/properties/vmarg_map.h"

#include "tests/unit/support.h"

#include <gtest/gtest.h>

#include <cerrno>

typedef std::vector<std::wstring> Texts;

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

// Words as a process has them.
struct OwnWords {
    OwnWords(std::initializer_list<const wchar_t*> all) : vector(words(all)), blocks(vector) {}
    ~OwnWords()
    {
        freeProperties(blocks);
    }
    OwnWords(const OwnWords&) = delete;
    OwnWords& operator=(const OwnWords&) = delete;

    ArgumentVector vector;
    ArgumentVector blocks;
};

// The keys and values in the order of the map.
static Texts inOrder(const VmargMap& map)
{
    Texts out;
    for (const VmargMap::value_type& entry : map) {
        out.push_back(entry.first);
        out.push_back(entry.second);
    }
    return out;
}

static void insertArgs(VmargMap& map, OwnWords& argv, ArgumentVector& outArgs)
{
    insertArgsToVmargMap(map, static_cast<int>(argv.vector.size()), argv.vector.data(), outArgs);
}

TEST(insertPropToVmargMap, MovesTheNamedArgumentsOutOfTheList)
{
    OwnList own(
        {L"a", L"1", L"vmarg.Xmx", L"-Xmx512m", L"b", L"2", L"vmarg.x", L"-Dx", L"a", L"3"});
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(texts(own.list), Texts({L"a", L"1", L"b", L"2", L"a", L"3"}));
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.Xmx", L"-Xmx512m", L"vmarg.x", L"-Dx"}));
}

TEST(insertPropToVmargMap, KeepsTheOtherBlocks)
{
    OwnList own({L"vmarg.a", L"1", L"b", L"2"});
    wchar_t* key = own.list[2];
    wchar_t* value = own.list[3];
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(own.list, PropertyList({key, value}));
}

TEST(insertPropToVmargMap, ListOfNamedArgumentsAloneBecomesEmpty)
{
    OwnList own({L"vmarg.b", L"1", L"vmarg.a", L"2"});
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_TRUE(own.list.empty());
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"2", L"vmarg.b", L"1"}));
}

TEST(insertPropToVmargMap, EmptyListChangesNothing)
{
    PropertyList list;
    VmargMap map = {{L"vmarg.a", L"1"}};
    insertPropToVmargMap(map, list);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"1"}));
}

TEST(insertPropToVmargMap, FirstSourceWinsAndTheOtherEntryIsGone)
{
    OwnList own({L"vmarg.Xmx", L"-Xmx256m", L"vmarg.c", L"1", L"vmarg.c", L"2"});
    VmargMap map = {{L"vmarg.Xmx", L"-Xmx512m"}};
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.Xmx", L"-Xmx512m", L"vmarg.c", L"1"}));
    EXPECT_TRUE(own.list.empty());
}

TEST(insertPropToVmargMap, EmptyArgumentKeepsLaterSourcesOut)
{
    OwnList own({L"vmarg.Xmx", L"-Xmx256m"});
    VmargMap map = {{L"vmarg.Xmx", L""}};
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.Xmx", L""}));
}

TEST(insertPropToVmargMap, PrefixIsExact)
{
    OwnList own({L"Vmarg.x", L"1", L"vmargx", L"2", L"avmarg.x", L"vmarg.v", L"vmarg", L"3"});
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_TRUE(map.empty());
    EXPECT_EQ(own.list.size(), 8u);
}

TEST(insertPropToVmargMap, NameMayBeEmpty)
{
    OwnList own({L"vmarg.", L"-Dx"});
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.", L"-Dx"}));
}

TEST(vmargMap, OrderIsThatOfTheCharacters)
{
    OwnList own({L"vmarg.b", L"-Xb", L"vmarg.a", L"-Xa", L"vmarg.\u00e9", L"4", L"vmarg.Z", L"-XZ",
                 L"vmarg.a.1", L"-X1", L"vmarg.10", L"2", L"vmarg.9", L"3"});
    VmargMap map;
    insertPropToVmargMap(map, own.list);
    EXPECT_EQ(inOrder(map),
              Texts({L"vmarg.10", L"2", L"vmarg.9", L"3", L"vmarg.Z", L"-XZ", L"vmarg.a", L"-Xa",
                     L"vmarg.a.1", L"-X1", L"vmarg.b", L"-Xb", L"vmarg.\u00e9", L"4"}));
}

TEST(insertArgsToVmargMap, TakesTheNamedArgumentsAndHandsTheOthersOn)
{
    OwnWords argv({L"velmora", L"vmarg.Xmx=-Xmx512m", L"-data", L"A", L"vmarg.a=-Da", L"-debug"});
    VmargMap map;
    ArgumentVector outArgs;
    insertArgs(map, argv, outArgs);
    EXPECT_EQ(texts(outArgs), Texts({L"velmora", L"-data", L"A", L"-debug"}));
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.Xmx", L"-Xmx512m", L"vmarg.a", L"-Da"}));
}

TEST(insertArgsToVmargMap, HandsOnTheVeryWords)
{
    OwnWords argv({L"velmora", L"vmarg.a=1", L"-debug"});
    VmargMap map;
    ArgumentVector outArgs;
    insertArgs(map, argv, outArgs);
    EXPECT_EQ(outArgs, ArgumentVector({argv.vector[0], argv.vector[2]}));
    EXPECT_EQ(texts(argv.vector), Texts({L"velmora", L"vmarg.a=1", L"-debug"}));
}

TEST(insertArgsToVmargMap, ReplacesTheResultAsAWhole)
{
    OwnWords argv({L"velmora"});
    OwnWords old({L"old", L"words"});
    VmargMap map;
    insertArgs(map, argv, old.vector);
    EXPECT_EQ(texts(old.vector), Texts({L"velmora"}));
}

TEST(insertArgsToVmargMap, ArgcCounts)
{
    OwnWords argv({L"velmora", L"vmarg.a=1", L"vmarg.b=2", L"-debug"});
    VmargMap map;
    ArgumentVector outArgs;
    insertArgsToVmargMap(map, 2, argv.vector.data(), outArgs);
    EXPECT_EQ(texts(outArgs), Texts({L"velmora"}));
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"1"}));
}

TEST(insertArgsToVmargMap, SplitsAtTheFirstEqualsSign)
{
    OwnWords argv({L"vmarg.a=-Dx=1=2", L"vmarg.b=", L"vmarg.=c", L"vmarg.d==e"});
    VmargMap map;
    ArgumentVector outArgs;
    insertArgs(map, argv, outArgs);
    EXPECT_EQ(inOrder(map),
              Texts({L"vmarg.", L"c", L"vmarg.a", L"-Dx=1=2", L"vmarg.b", L"", L"vmarg.d", L"=e"}));
    EXPECT_TRUE(outArgs.empty());
}

TEST(insertArgsToVmargMap, FirstWordOfANameWins)
{
    OwnWords argv({L"vmarg.a=", L"vmarg.a=2", L"vmarg.c=3"});
    VmargMap map = {{L"vmarg.c", L"1"}};
    ArgumentVector outArgs;
    insertArgs(map, argv, outArgs);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"", L"vmarg.c", L"1"}));
}

TEST(insertArgsToVmargMap, OtherWordsTravelOn)
{
    OwnWords argv({L"Vmarg.x=1", L"vmargx=1", L"-vmarg.x=1", L"vmarg", L""});
    VmargMap map;
    ArgumentVector outArgs;
    insertArgs(map, argv, outArgs);
    EXPECT_EQ(outArgs, argv.vector);
    EXPECT_TRUE(map.empty());
}

TEST(insertArgsToVmargMap, EndsForAWordWithoutAnEqualsSign)
{
    for (const wchar_t* word : {L"vmarg.Xmx", L"vmarg."}) {
        OwnWords argv({L"velmora", L"vmarg.a=1", word});
        EXPECT_TRUE(endsWith(
            [&] {
                VmargMap map;
                ArgumentVector outArgs;
                errno = ENOENT;
                insertArgs(map, argv, outArgs);
            },
            "QVMRL0033E: velmora invoked with an invalid vmarg.", ENOENT));
    }
}

TEST(insertCargsToVmargMap, TakesTheNamedArgumentsInPlace)
{
    OwnWords own({L"vmarg.b=-Dx=1=2", L"-data", L"vmarg.a=", L"A", L"Vmarg.x=1", L"vmargx=1"});
    VmargMap map;
    insertCargsToVmargMap(map, own.vector);
    EXPECT_EQ(own.vector,
              ArgumentVector({own.blocks[1], own.blocks[3], own.blocks[4], own.blocks[5]}));
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"", L"vmarg.b", L"-Dx=1=2"}));
}

TEST(insertCargsToVmargMap, FreesNothing)
{
    OwnWords own({L"vmarg.a=1", L"-data"});
    VmargMap map;
    insertCargsToVmargMap(map, own.vector);
    EXPECT_EQ(texts(own.blocks), Texts({L"vmarg.a=1", L"-data"}));
}

TEST(insertCargsToVmargMap, WordsSeenAgainChangeNothing)
{
    OwnWords own({L"vmarg.a=2", L"vmarg.b=3"});
    VmargMap map = {{L"vmarg.a", L"1"}};
    insertCargsToVmargMap(map, own.vector);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.a", L"1", L"vmarg.b", L"3"}));
    EXPECT_TRUE(own.vector.empty());
}

TEST(insertCargsToVmargMap, EndsForAWordWithoutAnEqualsSign)
{
    OwnWords own({L"-data", L"vmarg.Xmx"});
    EXPECT_TRUE(endsWith(
        [&] {
            VmargMap map;
            errno = EACCES;
            insertCargsToVmargMap(map, own.vector);
        },
        "QVMRL0128E: velmora invoked with an invalid vmarg.", EACCES));
}

TEST(vmargMap, SourcesInTheirOrderOfPrecedence)
{
    VmargMap map;
    OwnWords commandLine({L"velmora", L"vmarg.Xmx=-Xmx512m", L"vmarg.off="});
    OwnWords merged({L"vmarg.Xmx=-Xmx1g", L"vmarg.c=-Dext"});
    OwnList user({L"vmarg.c", L"-Duser", L"vmarg.d", L"-Duser", L"vmarg.off", L"-Duser"});
    OwnList jvm({L"vmarg.Xmx", L"-Xmx256m", L"vmarg.d", L"-Djvm", L"vmarg.e", L"-Djvm"});
    ArgumentVector outArgs;
    insertArgs(map, commandLine, outArgs);
    insertCargsToVmargMap(map, merged.vector);
    insertPropToVmargMap(map, user.list);
    insertPropToVmargMap(map, jvm.list);
    EXPECT_EQ(inOrder(map), Texts({L"vmarg.Xmx", L"-Xmx512m", L"vmarg.c", L"-Dext", L"vmarg.d",
                                   L"-Duser", L"vmarg.e", L"-Djvm", L"vmarg.off", L""}));
}
