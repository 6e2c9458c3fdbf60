#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"

#include "tests/folders/FolderServer.h"
#include <cstring>
#include <gtest/gtest.h>
#include <utility>

using comgui::test::ContainerFake;

using TRANSLATED = clSETMULTIPAR_FOLDER_VARIABLES;

static_assert(std::has_virtual_destructor_v<TRANSLATED>);
static_assert(sizeof(TRANSLATED) == 40);

namespace
{
SETMULTIPAR Text(char const* key, char const* value, bool ok = false)
{
    return {key, PARAM_STRING, 0, value, -1, ok, {}};
}

char const* TextOf(SETMULTIPAR const& record) { return static_cast<char const*>(record.value); }

// X is /a.
class TableTranslation : public testing::Test
{
protected:
    TableTranslation() { translator->SetFolderVariable("X", "/a"); }

    // Neither copied nor translated, whichever way.
    void ExpectUntouched(clFOLDER_VARIABLES* given, SETMULTIPAR* table)
    {
        for (bool const encode : {true, false})
        {
            TRANSLATED const translated(given, table, encode);
            EXPECT_EQ(translated.source, table);
            EXPECT_EQ(translated.current, table);
            EXPECT_EQ(translated.copy, nullptr);
            EXPECT_EQ(translated.cache, nullptr);
        }
    }

    std::unique_ptr<clFOLDER_VARIABLES> translator = EmptyTranslator();
    clFOLDER_VARIABLES* const folders = translator.get();
    int const number = 7;
    SETMULTIPAR const integer = {"I", PARAM_INT, 0, &number, 2, false, {}};
};
}  // namespace

TEST_F(TableTranslation, WithoutTranslator_LeavesTheTable)
{
    SETMULTIPAR table[] = {Text("K", "/a/x"), {}};
    ExpectUntouched(nullptr, table);
    ExpectUntouched(nullptr, nullptr);
}

TEST_F(TableTranslation, WithoutRecords_LeavesTheTable)
{
    SETMULTIPAR table[] = {{}};
    ExpectUntouched(folders, table);
}

TEST_F(TableTranslation, WithoutTexts_LeavesTheTable)
{
    SETMULTIPAR table[] = {integer, integer, {}};
    ExpectUntouched(folders, table);
}

TEST_F(TableTranslation, OfNullAndEmptyTexts_LeavesTheTable)
{
    SETMULTIPAR table[] = {Text("N", nullptr), Text("E", ""), {}};
    ExpectUntouched(folders, table);
}

TEST_F(TableTranslation, TextBehindTheTerminator_IsNotSeen)
{
    SETMULTIPAR table[] = {{}, Text("K", "/a/x"), {}};
    ExpectUntouched(folders, table);
}

TEST_F(TableTranslation, OtherTypesThatPointAtText_AreNotTranslated)
{
    for (int type = PARAM_NONE; type <= PARAM_UNSIGNED64; ++type)
    {
        if (type == PARAM_STRING)
            continue;
        SETMULTIPAR table[] = {Text("K", "/a/x"), {}};
        table[0].type = static_cast<PARAM_TYPE>(type);
        ExpectUntouched(folders, table);
    }
}

TEST_F(TableTranslation, TextsOutsideAnyFolder_AreCopiedForNothing)
{
    SETMULTIPAR table[] = {Text("K", "/other/x"), integer, {}};
    TRANSLATED translated(folders, table, true);
    ASSERT_NE(translated.copy, nullptr);
    EXPECT_EQ(translated.current, table);
    EXPECT_NE(translated.cache, nullptr);
    EXPECT_EQ(translated.copy[0].value, table[0].value);
    translated.copy[0].ok = true;
    translated.ResultCpy();
    EXPECT_FALSE(table[0].ok);
}

TEST_F(TableTranslation, ChangedText_StandsInTheCopyAlone)
{
    char const* const path = "/a/x";
    SETMULTIPAR table[] = {integer, Text("K", path), Text("E", ""), Text("N", nullptr), {}};
    TRANSLATED const translated(folders, table, true);
    EXPECT_EQ(translated.source, table);
    ASSERT_NE(translated.copy, nullptr);
    EXPECT_EQ(translated.current, translated.copy);
    EXPECT_EQ(table[1].value, path);
    EXPECT_STREQ(TextOf(translated.current[1]), "$(X)/x");
    EXPECT_EQ(translated.current[2].value, table[2].value);
    EXPECT_EQ(translated.current[3].value, nullptr);
    EXPECT_EQ(translated.current[4].key, nullptr);
}

TEST_F(TableTranslation, Copy_SharesEverythingElse)
{
    SETMULTIPAR table[] = {integer, Text("K", "/a/x", true), Text("U", "unchanged"), {}};
    table[1].pos = 5;
    table[1].reserved12 = 12;
    std::memcpy(table[1].reserved29, "xyz", 3);
    TRANSLATED const translated(folders, table, true);
    SETMULTIPAR const* const current = translated.current;
    for (int i = 0; i < 4; ++i)
    {
        SETMULTIPAR expected = table[i];
        if (i == 1)
            expected.value = current[i].value;
        EXPECT_EQ(std::memcmp(&current[i], &expected, sizeof expected), 0) << i;
    }
}

TEST_F(TableTranslation, Decoding_GivesForwardSlashes)
{
    SETMULTIPAR table[] = {Text("V", "$(X)\\x"), Text("P", "b\\c"), Text("U", "$(NOPE)\\x"), {}};
    TRANSLATED const translated(folders, table, false);
    EXPECT_STREQ(TextOf(translated.current[0]), "/a/x");
    EXPECT_STREQ(TextOf(translated.current[1]), "b/c");
    EXPECT_EQ(translated.current[2].value, table[2].value);
}

TEST_F(TableTranslation, Fields_StandInTheirOrder)
{
    SETMULTIPAR table[] = {Text("K", "/a/x"), {}};
    TRANSLATED translated(folders, table, true);
    translated.current = table + 1;
    void* words[5] = {};
    std::memcpy(words, static_cast<void const*>(&translated), sizeof translated);
    EXPECT_EQ(words[1], translated.source);
    EXPECT_EQ(words[2], translated.copy);
    EXPECT_EQ(words[3], translated.current);
    EXPECT_EQ(words[4], translated.cache);
}

TEST_F(TableTranslation, AnyChangedRecord_PutsTheCopyToUse)
{
    for (int changed = 0; changed < 3; ++changed)
    {
        SETMULTIPAR table[] = {Text("1", "x"), Text("2", "y"), Text("3", "z"), {}};
        table[changed].value = "/a";
        TRANSLATED const translated(folders, table, true);
        EXPECT_EQ(translated.current, translated.copy);
        EXPECT_STREQ(TextOf(translated.current[changed]), "$(X)");
    }
}

TEST_F(TableTranslation, EqualTexts_ShareOneTranslation)
{
    std::string const first = "/a/x";
    std::string const second = "/a/x";
    SETMULTIPAR table[] = {Text("1", first.c_str()), Text("2", second.c_str()), Text("3", "/a\\x"), {}};
    TRANSLATED const translated(folders, table, true);
    EXPECT_STREQ(TextOf(translated.current[0]), "$(X)/x");
    EXPECT_EQ(translated.current[1].value, translated.current[0].value);
    EXPECT_EQ(translated.current[2].value, translated.current[0].value);
}

TEST_F(TableTranslation, ResultCpy_CopiesEveryOkAndNothingElse)
{
    SETMULTIPAR table[] = {Text("K", "/a/x"), integer, Text("U", "x", true), {}};
    TRANSLATED translated(folders, table, true);
    SETMULTIPAR* const current = translated.current;
    current[0].ok = true;
    current[1].ok = true;
    current[2].ok = false;
    current[0].pos = 9;
    current[1].value = nullptr;
    translated.ResultCpy();
    EXPECT_TRUE(table[0].ok);
    EXPECT_TRUE(table[1].ok);
    EXPECT_FALSE(table[2].ok);
    EXPECT_EQ(table[0].pos, -1);
    EXPECT_STREQ(TextOf(table[0]), "/a/x");
    EXPECT_EQ(table[1].value, &number);
}

TEST_F(TableTranslation, ResultCpy_TakesAnyByteButZeroForTrue)
{
    SETMULTIPAR table[] = {Text("K", "/a/x"), {}};
    TRANSLATED translated(folders, table, true);
    unsigned char const byte = 0x80;
    std::memcpy(&translated.current[0].ok, &byte, 1);
    translated.ResultCpy();
    unsigned char copied = 0;
    std::memcpy(&copied, &table[0].ok, 1);
    EXPECT_EQ(copied, 1);
}

TEST_F(TableTranslation, ResultCpy_WithoutAChange_LeavesEveryByte)
{
    SETMULTIPAR table[] = {Text("K", "/other/x"), {}};
    unsigned char const byte = 0x80;
    std::memcpy(&table[0].ok, &byte, 1);
    TRANSLATED translated(folders, table, true);
    ASSERT_EQ(translated.current, table);
    translated.ResultCpy();
    EXPECT_EQ(std::memcmp(&table[0].ok, &byte, 1), 0);
}

TEST_F(TableTranslation, ResultCpy_WithoutOneOfTheTables_DoesNothing)
{
    SETMULTIPAR table[] = {Text("K", "/a/x"), {}};
    TRANSLATED translated(folders, table, true);
    translated.current[0].ok = true;
    SETMULTIPAR* const current = std::exchange(translated.current, nullptr);
    translated.ResultCpy();
    translated.current = current;
    translated.source = nullptr;
    translated.ResultCpy();
    EXPECT_FALSE(table[0].ok);

    SETMULTIPAR empty[] = {{}};
    translated.source = empty;
    translated.ResultCpy();
    EXPECT_FALSE(empty[0].ok);
}

TEST_F(TableTranslation, WrittenTable_CarriesTheTranslationAndBringsBackWhatBecameOfIt)
{
    ContainerFake server;
    server.AddTicket(3, 1);
    SETMULTIPAR table[] = {Text("Folder", "/a/x"), {"Bad", PARAM_COUNT, 0, &number, -1, true, {}}, {}};
    TRANSLATED translated(folders, table, true);
    server.Access()->MSETMULTIPAR(server.Access()->Instance, 3, 1, translated.current);
    translated.ResultCpy();
    EXPECT_EQ(server.Text(3, 1, "Folder"), "$(X)/x");
    EXPECT_TRUE(table[0].ok);
    EXPECT_FALSE(table[1].ok);
}

TEST_F(TableTranslation, TableNeedsEncodeDecode_OnlyWithATextThatIsNotEmpty)
{
    SETMULTIPAR const empty[] = {{}};
    SETMULTIPAR const others[] = {integer, Text("N", nullptr), Text("E", ""), {}};
    SETMULTIPAR const last[] = {integer, Text("N", nullptr), Text("E", ""), Text("K", "x"), {}};
    EXPECT_FALSE(TRANSLATED::TableNeedsEncodeDecode(empty));
    EXPECT_FALSE(TRANSLATED::TableNeedsEncodeDecode(others));
    EXPECT_TRUE(TRANSLATED::TableNeedsEncodeDecode(last));
}

TEST_F(TableTranslation, TableSize_CountsTheTerminator)
{
    SETMULTIPAR const table[] = {integer, Text("N", nullptr), {}};
    EXPECT_EQ(TRANSLATED::TableSize(table), 96u);
    EXPECT_EQ(TRANSLATED::TableSize(table + 2), 32u);
}
