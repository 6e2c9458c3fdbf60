// Failures as values.
#include "comgui/client/Result.h"
#include "comgui/client/Value.h"

#include <cstdint>
#include <fstream>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <iterator>
#include <vector>
#include <wx/arrstr.h>
#include <wx/init.h>
#include <wx/translation.h>

using namespace comgui;
using testing::HasSubstr;

namespace
{
struct MESSAGE
{
    std::string text;
    std::string translation;
};

// The bytes of a catalogue as msgfmt makes them. messages: by their texts, bytewise.
std::string CatalogueOf(std::vector<MESSAGE> const& messages)
{
    std::string numbers, texts;
    auto const count = static_cast<std::uint32_t>(messages.size());
    auto const put = [&numbers](std::size_t number)
    {
        auto const word = static_cast<std::uint32_t>(number);
        numbers.append(reinterpret_cast<char const*>(&word), sizeof word);
    };
    std::size_t const begin = 28 + 16 * messages.size();
    for (std::size_t const word : {std::size_t{0x950412DE}, std::size_t{0}, std::size_t{count},
                                   std::size_t{28}, 28 + 8 * messages.size(), std::size_t{0}, begin})
        put(word);
    for (auto const part : {&MESSAGE::text, &MESSAGE::translation})
        for (MESSAGE const& message : messages)
        {
            put((message.*part).size());
            put(begin + texts.size());
            texts += message.*part + '\0';
        }
    return numbers + texts;
}

class GermanCatalogue : public wxTranslationsLoader
{
    wxMsgCatalog* LoadCatalog(wxString const& domain, wxString const& language) override
    {
        std::string const bytes =
            CatalogueOf({{"", "Content-Type: text/plain; charset=UTF-8\n"},
                         {"not logged in", "nicht angemeldet"},
                         {"the server refuses, with code %d", "der Server lehnt ab, Grund %d"},
                         {"wrong user or password", "falscher Name oder falsches Kennwort: pr\xC3\xBC"
                                                    "fen"}});
        if (domain != "comgui" || language != "de")
            return nullptr;
        return wxMsgCatalog::CreateFromData(wxScopedCharBuffer::CreateNonOwned(bytes.data(), bytes.size()),
                                            domain);
    }
    wxArrayString GetAvailableTranslations(wxString const&) const override
    {
        return wxArrayString(1, &German);
    }

    wxString const German = "de";
};
}  // namespace

TEST(ErrorTexts, AreInOrder_AndEachHasWords)
{
    int last = ErrorTexts()[0].code - 1;
    int count = 0;
    for (ERROR_TEXT const* known = ErrorTexts(); known->text; ++known, ++count)
    {
        EXPECT_GT(known->code, last);
        EXPECT_GT(std::string_view(known->text).size(), 5u);
        last = known->code;
    }
    EXPECT_GT(count, 40);
}

TEST(ErrorTexts, HaveAllCodesOfTheKit)
{
    for (int code = TooLong; code <= NoPlugIn; ++code)
        EXPECT_THAT((Error{code, {}, {}}).Text(), testing::Not(HasSubstr("code"))) << code;
}

TEST(Error, Text_IsOneLineOfAllItsParts)
{
    EXPECT_EQ((Error{107, "admin", {}}).Text(), "admin: wrong user or password");
    EXPECT_EQ((Error{106, {}, "disk full"}).Text(), "the server cannot reach its data (disk full)");
    EXPECT_EQ((Error{777, {}, {}}).Text(), "the server refuses, with code 777");
}

TEST(Error, OfAServerThatIsAway_IsTransient)
{
    EXPECT_TRUE((Error{ServerAway, {}, {}}).IsTransient());
    EXPECT_TRUE((Error{106, {}, {}}).IsTransient());
    EXPECT_FALSE((Error{107, {}, {}}).IsTransient());
    EXPECT_FALSE((Error{OutOfRange, {}, {}}).IsTransient());
}

TEST(Result, HoldsEitherOne)
{
    Result<int> const good = 5;
    EXPECT_TRUE(good);
    EXPECT_EQ(*good, 5);
    EXPECT_THROW((void)good.GetError(), std::bad_variant_access);
    Result<int> const bad = Error{WrongType, {}, {}};
    EXPECT_FALSE(bad);
    EXPECT_EQ(bad.GetError().code, WrongType);
    EXPECT_EQ(bad.ValueOr(9), 9);
    EXPECT_THROW((void)*bad, std::bad_variant_access);
    EXPECT_TRUE(Outcome());
    EXPECT_THROW((void)Outcome().GetError(), std::bad_optional_access);
}

TEST(Error, Text_IsInTheLanguageOfTheUser)
{
    auto* const translations = new wxTranslations;
    wxTranslations::Set(translations);  // its owner
    translations->SetLoader(new GermanCatalogue);
    translations->SetLanguage("de");
    ASSERT_TRUE(translations->AddCatalog("comgui"));
    EXPECT_EQ((Error{NotLoggedIn, {}, {}}).Text(), "nicht angemeldet");
    EXPECT_EQ((Error{107, "admin", "why"}).Text(), "admin: falscher Name oder falsches Kennwort: pr\xC3\xBC"
                                                   "fen (why)");
    EXPECT_EQ((Error{777, {}, {}}).Text(), "der Server lehnt ab, Grund 777");
    EXPECT_EQ((Error{NoSuchKey, {}, {}}).Text(), "there is no such value");
    wxTranslations::Set(nullptr);
    EXPECT_EQ((Error{NotLoggedIn, {}, {}}).Text(), "not logged in");
}

TEST(ErrorTexts, AreAllInTheTemplateForTranslators)
{
    std::ifstream file(COMGUI_POT);
    std::string const all((std::istreambuf_iterator<char>(file)), {});
    ASSERT_THAT(all, HasSubstr("msgid \"\"\n"));
    for (ERROR_TEXT const* known = ErrorTexts(); known->text; ++known)
        EXPECT_THAT(all, HasSubstr("msgid \"" + std::string(known->text) + "\"\n"));
    EXPECT_THAT(all, HasSubstr("msgid \"the server refuses, with code %d\"\n"));
    EXPECT_THAT(all, testing::Not(HasSubstr("msgid \"a text that no error has\"\n")));
}

#ifdef COMGUI_CATALOGUES
class Language : public testing::TestWithParam<char const*>
{
protected:
    void SetUp() override
    {
        wxString const catalogues = COMGUI_CATALOGUES;
        wxString const language = GetParam();
        // [translations]
        wxFileTranslationsLoader::AddCatalogLookupPathPrefix(catalogues);  // the folder share/locale
        auto* const translations = new wxTranslations;
        wxTranslations::Set(translations);
        translations->SetLanguage(language);  // "de"; without this call: what the system is set to
        translations->AddCatalog("comgui");
        // [/translations]
        ASSERT_TRUE(translations->IsLoaded("comgui"));
    }
    void TearDown() override { wxTranslations::Set(nullptr); }

private:
    wxInitializer m_wxWidgets;  // catalogues are looked for beside the program, which wxWidgets has to know
};

using German = Language;

TEST_P(German, Text_OfAnError_IsTranslated_ButNotItsOtherParts)
{
    EXPECT_EQ((Error{107, "admin", {}}).Text(), "admin: Benutzer oder Passwort falsch");
    EXPECT_EQ((Error{106, {}, "disk full"}).Text(), "der Server kommt nicht an seine Daten (disk full)");
    EXPECT_EQ((Error{777, {}, {}}).Text(), "der Server lehnt ab, mit Code 777");
}

TEST_P(German, NamesOfTypes_AreTranslatedByTheProgram)
{
    EXPECT_STREQ(NameOf(PARAM_COUNT), "list");
    EXPECT_EQ(wxGetTranslation(NameOf(PARAM_COUNT), "comgui"), "Liste");
}

INSTANTIATE_TEST_SUITE_P(Catalogue, German, testing::Values("de"));

TEST_P(Language, HasEachErrorText)
{
    for (ERROR_TEXT const* known = ErrorTexts(); known->text; ++known)
        EXPECT_NE((Error{known->code, {}, {}}).Text(), known->text) << known->code;
}

INSTANTIATE_TEST_SUITE_P(Catalogues, Language, testing::Values("de", "fr", "ja"));
#endif
