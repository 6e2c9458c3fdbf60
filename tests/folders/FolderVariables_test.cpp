// The translator by plain functions.
#include "comgui/folders/FolderVariables.h"

#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"
#include "tests/folders/FolderRows.h"
#include "tests/folders/FolderServer.h"
#include <dlfcn.h>
#include <gmock/gmock.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
// TEMP is /srv/temp, by the key System/Folders/Temp. Texts that come out are kept in order.
class PlainFunctions : public testing::Test
{
protected:
    PlainFunctions()
    {
        server.SetFolder("System/Folders/Temp", "/srv/temp");
        folders = server.Translator();
    }

    static std::intptr_t Keep(void* user, char const* text)
    {
        static_cast<PlainFunctions*>(user)->texts.emplace_back(text);
        return Result;
    }

    static std::intptr_t DecodeAndKeep(void* user, char const* text)
    {
        return DecodeFolder(static_cast<PlainFunctions*>(user)->folders.get(), Keep, user, text, false);
    }

    static constexpr std::intptr_t Result = INTPTR_MIN + 5;  // more than an int holds
    FolderServer server;
    std::unique_ptr<clFOLDER_VARIABLES> folders;
    std::vector<std::string> texts;
};
}  // namespace

TEST_F(PlainFunctions, EncodeFolderFull_EncodesThePath)
{
    EXPECT_EQ(EncodeFolderFull(folders.get(), Keep, this, "/srv/temp\\x"), Result);
    EXPECT_THAT(texts, ElementsAre("$(TEMP)/x"));
}

TEST_F(PlainFunctions, EncodeFolderRelative_EncodesBelowTheKey)
{
    EXPECT_EQ(EncodeFolderRelative(folders.get(), Keep, this, "System/Folders/Temp", "a\\b"), Result);
    EXPECT_THAT(texts, ElementsAre("$(TEMP)/a/b"));
}

TEST_F(PlainFunctions, EncodeFolderRelative_NullKey_HandsThePathBack)
{
    EXPECT_EQ(EncodeFolderRelative(folders.get(), Keep, this, nullptr, "a\\b"), Result);
    EXPECT_THAT(texts, ElementsAre("a\\b"));
}

TEST_F(PlainFunctions, DecodeFolder_DecodesWithTheSeparatorsAskedFor)
{
    EXPECT_EQ(DecodeFolder(folders.get(), Keep, this, "$(TEMP)/x", false), Result);
    EXPECT_EQ(DecodeFolder(folders.get(), Keep, this, "$(TEMP)/x", true), Result);
    EXPECT_THAT(texts, ElementsAre("/srv/temp/x", "\\srv\\temp\\x"));
}

TEST_F(PlainFunctions, NothingToTranslate_StillCallsOnce)
{
    EXPECT_EQ(EncodeFolderFull(folders.get(), Keep, this, "C:\\a"), Result);
    EXPECT_EQ(EncodeFolderRelative(folders.get(), Keep, this, "Nope", "a\\b"), Result);
    EXPECT_EQ(DecodeFolder(folders.get(), Keep, this, "$(NOPE)/x\\y", false), Result);
    EXPECT_EQ(DecodeFolder(folders.get(), Keep, this, "", false), Result);
    EXPECT_THAT(texts, ElementsAre("C:\\a", "a\\b", "$(NOPE)/x\\y", ""));
}

TEST_F(PlainFunctions, NullTranslatorActionOrText_Gives0WithoutACall)
{
    EXPECT_EQ(EncodeFolderFull(nullptr, Keep, this, "a"), 0);
    EXPECT_EQ(EncodeFolderFull(folders.get(), nullptr, this, "a"), 0);
    EXPECT_EQ(EncodeFolderFull(folders.get(), Keep, this, nullptr), 0);
    EXPECT_EQ(EncodeFolderRelative(nullptr, Keep, this, "System/Folders/Temp", "a"), 0);
    EXPECT_EQ(EncodeFolderRelative(folders.get(), nullptr, this, "System/Folders/Temp", "a"), 0);
    EXPECT_EQ(EncodeFolderRelative(folders.get(), Keep, this, "System/Folders/Temp", nullptr), 0);
    EXPECT_EQ(DecodeFolder(nullptr, Keep, this, "a", false), 0);
    EXPECT_EQ(DecodeFolder(folders.get(), nullptr, this, "a", false), 0);
    EXPECT_EQ(DecodeFolder(folders.get(), Keep, this, nullptr, false), 0);
    EXPECT_THAT(texts, IsEmpty());
}

TEST_F(PlainFunctions, NullUser_IsHandedOn)
{
    auto const isNull = [](void* user, char const*) -> std::intptr_t { return user == nullptr ? 7 : 8; };
    EXPECT_EQ(EncodeFolderFull(folders.get(), isNull, nullptr, "a"), 7);
    EXPECT_EQ(EncodeFolderRelative(folders.get(), isNull, nullptr, nullptr, "a"), 7);
    EXPECT_EQ(DecodeFolder(folders.get(), isNull, nullptr, "a", true), 7);
}

TEST_F(PlainFunctions, TheAction_MayUseTheTranslator)
{
    EXPECT_EQ(EncodeFolderFull(folders.get(), DecodeAndKeep, this, "/srv/temp/x"), Result);
    EXPECT_THAT(texts, ElementsAre("/srv/temp/x"));
}

TEST_F(PlainFunctions, CreateFolderVariables_LoadsFromTheContainer)
{
    EXPECT_EQ(folders->Decode("$(TEMP)", false), "/srv/temp");
    EXPECT_TRUE(EmptyTranslator()->IsEnabled());
}

TEST(FolderNames, EveryRow_IsFoundByItsVariableAndByItsKey)
{
    for (FOLDER_ROW const& row : FolderRows)
    {
        EXPECT_STREQ(GetFolderKey(row.variable), row.key);
        EXPECT_STREQ(GetFolderVariable(row.key), row.variable);
    }
}

TEST(FolderNames, OddOnes_AreSpeltSo_ByDesign)
{
    EXPECT_STREQ(GetFolderKey("INSTALL"), "System/InstallFolder");
    EXPECT_STREQ(GetFolderVariable("System/Linearisation/LAB"), "LABCORRECTION");
    EXPECT_STREQ(GetFolderVariable("System/Folders/Update"), "UPDATES");
    EXPECT_STREQ(GetFolderKey("LIN_SPOTCOLOR"), "System/Folders/Linearisation/SpotColor");
    EXPECT_STREQ(GetFolderKey("SPOTCOLORTAB"), "System/Folders/SpotcolorTable");
}

TEST(FolderNames, UnknownNames_GiveNull)
{
    for (char const* name : {"install", "Temp", "", "TEM", "TEMPO", "System/Folders/Temp"})
        EXPECT_EQ(GetFolderKey(name), nullptr) << name;
    for (char const* name : {"system/folders/temp", "", "System/Folders/", "System/Folders/Temp/", "TEMP"})
        EXPECT_EQ(GetFolderVariable(name), nullptr) << name;
    EXPECT_EQ(GetFolderKey(nullptr), nullptr);
    EXPECT_EQ(GetFolderVariable(nullptr), nullptr);
}

TEST(FolderNames, Results_AreConstants)
{
    EXPECT_EQ(GetFolderKey("TEMP"), GetFolderKey("TEMP"));
    EXPECT_EQ(GetFolderVariable("System/Folders/Temp"), GetFolderVariable("System/Folders/Temp"));
}

TEST(PlainNames, AreFoundWithoutDeclarations)
{
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "CreateFolderVariables"), reinterpret_cast<void*>(&CreateFolderVariables));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "EncodeFolderFull"), reinterpret_cast<void*>(&EncodeFolderFull));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "EncodeFolderRelative"), reinterpret_cast<void*>(&EncodeFolderRelative));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "DecodeFolder"), reinterpret_cast<void*>(&DecodeFolder));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "GetFolderKey"), reinterpret_cast<void*>(&GetFolderKey));
    EXPECT_EQ(dlsym(RTLD_DEFAULT, "GetFolderVariable"), reinterpret_cast<void*>(&GetFolderVariable));
}

TEST(TableTranslator, MadeByATranslator_UsesTheOneGiven_ByDesign)
{
    auto const maker = EmptyTranslator();
    maker->SetFolderVariable("MAKER", "/a");
    auto const folders = EmptyTranslator();
    folders->SetFolderVariable("GIVEN", "/a");
    SETMULTIPAR table[] = {{"K", PARAM_STRING, 0, "/a/x", -1, false, {}}, {}};
    std::unique_ptr<clSETMULTIPAR_FOLDER_VARIABLES> const encoded(
        maker->New_clSETMULTIPAR_FOLDER_VARIABLES(folders.get(), table, true));
    EXPECT_STREQ(static_cast<char const*>(encoded->current[0].value), "$(GIVEN)/x");
    table[0].value = "$(GIVEN)/x";
    std::unique_ptr<clSETMULTIPAR_FOLDER_VARIABLES> const decoded(
        maker->New_clSETMULTIPAR_FOLDER_VARIABLES(folders.get(), table, false));
    EXPECT_STREQ(static_cast<char const*>(decoded->current[0].value), "/a/x");
    std::unique_ptr<clSETMULTIPAR_FOLDER_VARIABLES> const untranslated(
        maker->New_clSETMULTIPAR_FOLDER_VARIABLES(nullptr, table, false));
    EXPECT_EQ(untranslated->current, table);
}
