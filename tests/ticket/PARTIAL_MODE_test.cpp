#include "comgui/ticket/PARTIAL_MODE.h"

#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include <gtest/gtest.h>
#include <initializer_list>
#include <string>
#include <utility>
#include <vector>

namespace
{
// The prefixes as a host sees them: it can ask which one begins a text, and for no list.
std::string Found(STRINGPREFIXSET const& set, std::string const& text)
{
    auto const found = set.find(text);
    return found == set.end() ? "none" : *found;
}

STRINGPREFIXSET Prefixes(std::initializer_list<char const*> texts)
{
    STRINGPREFIXSET set;
    for (char const* const text : texts)
        set.insert(text);
    return set;
}

PARTIAL_MODE Mode(std::initializer_list<char const*> keys)
{
    std::vector<char const*> table(keys);
    table.push_back(nullptr);
    return PARTIAL_MODE(table.data());
}

void Set(PARTIAL_MODE& mode, std::initializer_list<char const*> keys)
{
    std::vector<char const*> table(keys);
    table.push_back(nullptr);
    mode.set(table.data());
}

// wildcard() takes its argument apart, so what is left of it is told too.
std::pair<bool, std::string> Wildcard(std::string key)
{
    bool const isPrefix = PARTIAL_MODE::wildcard(key);
    return {isPrefix, key};
}
}  // namespace

TEST(STRINGPREFIXSET_LESS, Texts_CompareAsFarAsTheShorterGoes)
{
    STRINGPREFIXSET::LESS const less;
    EXPECT_TRUE(less("ab", "ac"));
    EXPECT_FALSE(less("ac", "ab"));
    EXPECT_TRUE(less("abz", "ac"));
    EXPECT_FALSE(less("a", "ab"));
    EXPECT_FALSE(less("ab", "a"));
    EXPECT_FALSE(less("", "a"));
    EXPECT_FALSE(less("a", ""));
}

TEST(STRINGPREFIXSET_LESS, Bytes_CompareAsUnsigned)
{
    EXPECT_TRUE(STRINGPREFIXSET::LESS()("z", "\xC3\xA4"));
    EXPECT_FALSE(STRINGPREFIXSET::LESS()("\xC3\xA4", "z"));
}

TEST(STRINGPREFIXSET_LESS, Min_IsTheSmallerSize)
{
    EXPECT_EQ(STRINGPREFIXSET::LESS::min(2, 3), 2u);
    EXPECT_EQ(STRINGPREFIXSET::LESS::min(3, 2), 2u);
}

TEST(STRINGPREFIXSET, Object_HoldsItsSetAndNothingElse)
{
    EXPECT_EQ(sizeof(STRINGPREFIXSET), (sizeof(std::set<std::string, STRINGPREFIXSET::LESS>)));
}

TEST(STRINGPREFIXSET, Find_OfATextBegunByAnElement_GivesTheElement)
{
    EXPECT_EQ(Found(Prefixes({"Job/", "System/"}), "System/Folders/Temp"), "System/");
    EXPECT_EQ(Found(Prefixes({"Job/", "System/"}), "Job/"), "Job/");
}

TEST(STRINGPREFIXSET, Find_OfATextThatOnlyBeginsAnElement_GivesNone_ByDesign)
{
    EXPECT_EQ(Found(Prefixes({"Job/"}), "Job"), "none");
    EXPECT_EQ(Found(Prefixes({"Job/"}), ""), "none");
}

TEST(STRINGPREFIXSET, Find_OfAnUnrelatedText_GivesNone)
{
    EXPECT_EQ(Found(Prefixes({"Job/", "System/"}), "Queue/"), "none");
    EXPECT_EQ(Found(Prefixes({"Job/", "System/"}), "Zone/"), "none");
    EXPECT_EQ(Found(Prefixes({}), "Job/"), "none");
}

TEST(STRINGPREFIXSET, Find_TextWithZeroBytes_ComparesThemToo)
{
    using namespace std::string_literals;
    STRINGPREFIXSET set;
    set.insert("a\0b"s);
    EXPECT_NE(set.find("a\0bc"s), set.end());
    EXPECT_EQ(set.find("a\0c"s), set.end());
}

TEST(STRINGPREFIXSET, Insert_OfABroaderPrefix_ReplacesTheNarrowerOne)
{
    STRINGPREFIXSET const set = Prefixes({"System/", "Sys"});
    EXPECT_EQ(Found(set, "System/X"), "Sys");
    EXPECT_EQ(Found(set, "Sys"), "Sys");
}

TEST(STRINGPREFIXSET, Insert_OfACoveredPrefix_ChangesNothing)
{
    EXPECT_EQ(Found(Prefixes({"Sys", "System/"}), "System/X"), "Sys");
    EXPECT_EQ(Found(Prefixes({"Sys", "Sys"}), "Sys"), "Sys");
}

TEST(STRINGPREFIXSET, Insert_OfAPrefixOfTwoElements_CostsTheLowestAndIsNotInserted_ByDesign)
{
    STRINGPREFIXSET const set = Prefixes({"ac", "ab", "a"});
    EXPECT_EQ(Found(set, "ab"), "none");
    EXPECT_EQ(Found(set, "ac"), "ac");
    EXPECT_EQ(Found(set, "a"), "none");
}

TEST(STRINGPREFIXSET, InsertTwice_OfAPrefixOfTwoElements_ReplacesBoth_ByDesign)
{
    STRINGPREFIXSET const set = Prefixes({"ab", "ac", "a", "a"});
    EXPECT_EQ(Found(set, "ab"), "a");
    EXPECT_EQ(Found(set, "a"), "a");
}

TEST(STRINGPREFIXSET, Insert_OfAPrefixOfThreeElements_CostsOneOnly_ByDesign)
{
    STRINGPREFIXSET const set = Prefixes({"ab", "ac", "ad", "a"});
    EXPECT_EQ(Found(set, "ab"), "none");
    EXPECT_EQ(Found(set, "ac"), "ac");
    EXPECT_EQ(Found(set, "ad"), "ad");
}

TEST(STRINGPREFIXSET, Insert_OfTheEmptyText_ReplacesASingleElement)
{
    EXPECT_EQ(Found(Prefixes({"Job/", ""}), "System"), "");
}

TEST(STRINGPREFIXSET, Erase_OfAnElement_LeavesTheOthers)
{
    STRINGPREFIXSET set = Prefixes({"ab", "ac"});
    EXPECT_EQ(set.erase("ab"), 1u);
    EXPECT_EQ(Found(set, "ab"), "none");
    EXPECT_EQ(Found(set, "ac"), "ac");
}

TEST(STRINGPREFIXSET, Erase_OfANarrowerText_ErasesTheElementThatCoversIt_ByDesign)
{
    STRINGPREFIXSET set = Prefixes({"System/", "Job/"});
    EXPECT_EQ(set.erase("System/Folders"), 1u);
    EXPECT_EQ(Found(set, "System/X"), "none");
    EXPECT_EQ(Found(set, "Job/X"), "Job/");
}

TEST(STRINGPREFIXSET, Erase_OfABroaderOrUnknownText_ErasesNothing)
{
    STRINGPREFIXSET set = Prefixes({"System/", "Job/"});
    EXPECT_EQ(set.erase("Sys"), 0u);
    EXPECT_EQ(set.erase(""), 0u);
    EXPECT_EQ(set.erase("Queue/"), 0u);
    EXPECT_EQ(Found(set, "System/"), "System/");
    EXPECT_EQ(Found(set, "Job/"), "Job/");
}

TEST(STRINGPREFIXSET, EmptyAndClear_AreThoseOfTheSet)
{
    STRINGPREFIXSET set;
    EXPECT_TRUE(set.empty());
    set.insert("");
    EXPECT_FALSE(set.empty());
    set.clear();
    EXPECT_TRUE(set.empty());
    EXPECT_EQ(set.find("x"), set.end());
}

TEST(PARTIAL_MODE, Table_OfKeysAndPrefixes_SelectsThem)
{
    PARTIAL_MODE const mode = Mode({"System/Use", "Job/*"});
    EXPECT_TRUE(mode.multi_contains("System/Use"));
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    EXPECT_TRUE(mode.multi_contains("Job/"));
    EXPECT_FALSE(mode.multi_contains("System/User"));
    EXPECT_FALSE(mode.multi_contains("System/Us"));
    EXPECT_FALSE(mode.multi_contains("Job"));
    EXPECT_TRUE(mode.partial());
}

TEST(PARTIAL_MODE, OneKeyOrOnePrefix_IsPartial)
{
    EXPECT_TRUE(Mode({"System/Use"}).partial());
    EXPECT_TRUE(Mode({"Job/*"}).partial());
}

TEST(PARTIAL_MODE, NoPatterns_IsAWholeTicketAndSelectsNoKey_ByDesign)
{
    EXPECT_FALSE(PARTIAL_MODE(nullptr).partial());
    EXPECT_FALSE(PARTIAL_MODE(nullptr).multi_contains("Job/X"));
    EXPECT_FALSE(PARTIAL_MODE(nullptr).multi_contains(""));
    EXPECT_FALSE(Mode({}).partial());
}

TEST(PARTIAL_MODE, StarAlone_SelectsEveryKey)
{
    PARTIAL_MODE const mode = Mode({"*"});
    EXPECT_TRUE(mode.partial());
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    EXPECT_TRUE(mode.multi_contains(""));
}

TEST(PARTIAL_MODE, BroaderPrefix_ReplacesTheNarrowerOne)
{
    PARTIAL_MODE mode = Mode({"System/*", "Sys*"});
    EXPECT_TRUE(mode.multi_contains("Sys"));
    EXPECT_TRUE(mode.multi_contains("System/X"));
    mode.erase("Sys*");
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, NarrowerPrefix_ChangesNothing)
{
    PARTIAL_MODE mode = Mode({"Sys*", "System/*"});
    EXPECT_TRUE(mode.multi_contains("Sys"));
    mode.erase("Sys*");
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Set_OfARemovalList_ErasesWhatStandsBehindTheEmptyText)
{
    PARTIAL_MODE mode = Mode({"Job/*", "Job/", "System/Use", "System/Name"});
    Set(mode, {"", "Job/*", "System/Name"});
    EXPECT_FALSE(mode.multi_contains("Job/X"));
    EXPECT_FALSE(mode.multi_contains("System/Name"));
    EXPECT_TRUE(mode.multi_contains("Job/"));
    EXPECT_TRUE(mode.multi_contains("System/Use"));
}

TEST(PARTIAL_MODE, Set_OfARemovalListWithTheEmptyTextAgain_TakesItForAKey)
{
    PARTIAL_MODE mode = Mode({"Job/*"});
    Set(mode, {"", "", "Job/*"});
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Set_OfTheEmptyTextAlone_ChangesNothing)
{
    PARTIAL_MODE mode = Mode({"Job/*"});
    Set(mode, {""});
    EXPECT_TRUE(mode.multi_contains("Job/X"));
}

TEST(PARTIAL_MODE, Set_WithTheEmptyTextBehindAnother_IgnoresItAndInserts)
{
    PARTIAL_MODE const mode = Mode({"Job/*", "", "System/Use"});
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    EXPECT_TRUE(mode.multi_contains("System/Use"));
    EXPECT_FALSE(mode.multi_contains(""));
}

TEST(PARTIAL_MODE, Set_AddsToWhatIsThere)
{
    PARTIAL_MODE mode = Mode({"Job/*"});
    Set(mode, {"System/Use"});
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    EXPECT_TRUE(mode.multi_contains("System/Use"));
}

TEST(PARTIAL_MODE, Set_OfAnEmptyTable_ChangesNothing)
{
    PARTIAL_MODE mode = Mode({"Job/*"});
    Set(mode, {});
    EXPECT_TRUE(mode.multi_contains("Job/X"));
}

TEST(PARTIAL_MODE, Set_OfNull_Clears)
{
    PARTIAL_MODE mode = Mode({"Job/*", "System/Use"});
    mode.set(nullptr);
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Clear_EmptiesBothSets)
{
    PARTIAL_MODE mode = Mode({"Job/*", "System/Use"});
    mode.clear();
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Insert_OfTheEmptyText_ChangesNothing)
{
    PARTIAL_MODE mode(nullptr);
    mode.insert("");
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Insert_OfTwoStars_StoresThePrefixOfOne)
{
    PARTIAL_MODE mode(nullptr);
    mode.insert("**");
    EXPECT_TRUE(mode.multi_contains("*x"));
    EXPECT_FALSE(mode.multi_contains("x"));
}

TEST(PARTIAL_MODE, Insert_OfAKey_DoesNotMakeItAPrefix)
{
    PARTIAL_MODE mode(nullptr);
    mode.insert("Job");
    EXPECT_TRUE(mode.multi_contains("Job"));
    EXPECT_FALSE(mode.multi_contains("Job/X"));
}

TEST(PARTIAL_MODE, Erase_OfAKey_LeavesThePrefixOfThatText)
{
    PARTIAL_MODE mode = Mode({"Job", "Job*"});
    mode.erase("Job");
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    mode.erase("Job*");
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Erase_OfANarrowerPrefix_ErasesTheOneThatCoversIt_ByDesign)
{
    PARTIAL_MODE mode = Mode({"System/*"});
    mode.erase("System/Folders*");
    EXPECT_FALSE(mode.partial());
}

TEST(PARTIAL_MODE, Erase_OfAKeyThatAPrefixCovers_ChangesNothing)
{
    PARTIAL_MODE mode = Mode({"System/*"});
    mode.erase("System/Use");
    EXPECT_TRUE(mode.multi_contains("System/Use"));
}

TEST(PARTIAL_MODE, Copy_IsAValueOfItsOwn)
{
    PARTIAL_MODE const mode = Mode({"Job/*", "System/Use"});
    PARTIAL_MODE copy = mode;
    copy.clear();
    EXPECT_TRUE(mode.multi_contains("Job/X"));
    EXPECT_TRUE(mode.multi_contains("System/Use"));
}

TEST(PARTIAL_MODE, Wildcard_TakesTheStarOffTheEnd)
{
    EXPECT_EQ(Wildcard("Job/*"), std::pair(true, std::string("Job/")));
    EXPECT_EQ(Wildcard("*"), std::pair(true, std::string()));
    EXPECT_EQ(Wildcard("a**"), std::pair(true, std::string("a*")));
}

TEST(PARTIAL_MODE, Wildcard_WithNoStarAtTheEnd_LeavesTheText)
{
    EXPECT_EQ(Wildcard("a*b"), std::pair(false, std::string("a*b")));
    EXPECT_EQ(Wildcard("*b"), std::pair(false, std::string("*b")));
    EXPECT_EQ(Wildcard(""), std::pair(false, std::string()));
}

TEST(CollectActions, Objects_HoldTwoPointers)
{
    EXPECT_EQ(sizeof(PARTIAL_COLLECT_ACTION), 2 * sizeof(void*));
    EXPECT_EQ(sizeof(FILTERED_PARTIAL_COLLECT_ACTION), 2 * sizeof(void*));
}

namespace
{
// Whether a record of that key and type gets into the list by the action of a walk.
template <typename ACTION>
bool Takes(PARTIAL_MODE const& mode, char const* key, int type = PARAM_POINTER)
{
    SETMULTIPAR_LIST list(false);
    ACTION action(&list, mode);
    EXPECT_TRUE(ACTION::CollectAction(&action, key, static_cast<PARAM_TYPE>(type), nullptr, 0));
    return list.Size() == 1;
}
}  // namespace

TEST(PARTIAL_COLLECT_ACTION, CollectAction_TakesSelectedKeysOnly)
{
    EXPECT_TRUE(Takes<PARTIAL_COLLECT_ACTION>(Mode({"Job/*"}), "Job/X"));
    EXPECT_FALSE(Takes<PARTIAL_COLLECT_ACTION>(Mode({"Job/*"}), "System/X"));
}

TEST(FILTERED_PARTIAL_COLLECT_ACTION, CollectAction_TakesTheOtherKeysOnly)
{
    EXPECT_FALSE(Takes<FILTERED_PARTIAL_COLLECT_ACTION>(Mode({"Job/*"}), "Job/X"));
    EXPECT_TRUE(Takes<FILTERED_PARTIAL_COLLECT_ACTION>(Mode({"Job/*"}), "System/X"));
}

TEST(CollectActions, OfTypesThatAreNoParameters_TakeNothing)
{
    PARTIAL_MODE const all = Mode({"*"});
    PARTIAL_MODE const none(nullptr);
    for (int const type : {-1, static_cast<int>(PARAM_NONE), static_cast<int>(PARAM_COUNT), 10, 1000})
    {
        EXPECT_FALSE(Takes<PARTIAL_COLLECT_ACTION>(all, "key", type)) << type;
        EXPECT_FALSE(Takes<FILTERED_PARTIAL_COLLECT_ACTION>(none, "key", type)) << type;
    }
}

TEST(CollectActions, OfTypesOfParameters_TakeEach)
{
    PARTIAL_MODE const all = Mode({"*"});
    PARTIAL_MODE const none(nullptr);
    for (int const type : {PARAM_POINTER, PARAM_INT, PARAM_DOUBLE, PARAM_STRING, PARAM_BINSTRING, PARAM_INT64,
                           PARAM_UNSIGNED, PARAM_UNSIGNED64})
    {
        EXPECT_TRUE(Takes<PARTIAL_COLLECT_ACTION>(all, "key", type)) << type;
        EXPECT_TRUE(Takes<FILTERED_PARTIAL_COLLECT_ACTION>(none, "key", type)) << type;
    }
}

TEST(CollectActions, SetParameter_AddsAsAWalkDoes_AndGives1)
{
    SETMULTIPAR_LIST list(false);
    PARTIAL_MODE const mode = Mode({"Job/*"});
    double const value = 1.5;
    EXPECT_EQ(PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Job/X", PARAM_DOUBLE, &value, 0), 1);
    EXPECT_EQ(PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Y", PARAM_DOUBLE, &value, 0), 1);
    EXPECT_EQ(FILTERED_PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Y", PARAM_DOUBLE, &value, 2), 1);
    EXPECT_EQ(FILTERED_PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Job/X", PARAM_DOUBLE, &value, 2), 1);
    ASSERT_EQ(list.Size(), 2u);
    SETMULTIPAR const* const table = list.Table(false);
    EXPECT_STREQ(table[0].key, "Job/X");
    EXPECT_EQ(table[0].pos, -1);  // ySetParameter: xSetParameter would have kept 0 and copied the value
    EXPECT_EQ(table[0].value, &value);
    EXPECT_STREQ(table[1].key, "Y");
    EXPECT_EQ(table[1].pos, 2);
    EXPECT_EQ(table[1].value, &value);
}

TEST(CollectActions, SetParameter_DoesNotLookAtTheType_ByDesign)
{
    SETMULTIPAR_LIST list(false);
    PARTIAL_MODE const mode = Mode({"Job/*"});
    PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Job/X", PARAM_NONE, nullptr, -1);
    FILTERED_PARTIAL_COLLECT_ACTION(&list, mode).SetParameter("Y", PARAM_COUNT, nullptr, -1);
    EXPECT_EQ(list.Size(), 2u);
}
