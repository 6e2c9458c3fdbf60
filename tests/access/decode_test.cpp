// Which texts are resolved on their way to the host, by whom, and which are not.
#include "tests/access/Families.h"
#include "tests/access/FolderVariablesFake.h"
#include <gmock/gmock.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
template <typename Family>
class Decoding : public InBothFamilies<Family>
{
protected:
    Decoding() { this->ticket.SetTranslator(&folders); }

    wxString Read(char const* stored)
    {
        this->Put(stored);
        wxString text;
        EXPECT_TRUE(this->ticket.GetParameter("k", text, -1));
        return text;
    }

    FolderVariablesFake folders;
};
}  // namespace

TYPED_TEST_SUITE(Decoding, Families);

TYPED_TEST(Decoding, PathInVariableForm_IsResolvedWithForwardSlashes)
{
    EXPECT_EQ(this->Read("$(TEMP)/x"), "<$(TEMP)/x>");
    EXPECT_THAT(this->folders.decoded, ElementsAre("$(TEMP)/x"));
    EXPECT_FALSE(this->folders.backslashesAsked);
}

TYPED_TEST(Decoding, TextOfThreeBytes_IsReturnedAsItStands)
{
    EXPECT_EQ(this->Read("$(X"), "$(X");
    EXPECT_EQ(this->Read("$()"), "$()");
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 0u);
}

TYPED_TEST(Decoding, TextOfFourBytes_GoesToTheTranslator)
{
    EXPECT_EQ(this->Read("$()x"), "<$()x>");
    EXPECT_EQ(this->Read("$(XY"), "<$(XY>");
}

TYPED_TEST(Decoding, OtherBeginnings_AreReturnedAsTheyStand)
{
    for (char const* text : {"", "$", "(TEMP)/x", "$TEMP/x", "x$(TEMP)", "$[TEMP]"})
        EXPECT_EQ(this->Read(text), text);
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 0u);
    EXPECT_THAT(this->folders.decoded, IsEmpty());
}

TYPED_TEST(Decoding, WithoutATranslator_TheTextComesBackLiterally)
{
    this->ticket.SetTranslator(nullptr);
    EXPECT_EQ(this->Read("$(TEMP)/x"), "$(TEMP)/x");
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 1u);
}

TYPED_TEST(Decoding, TheTranslator_IsAskedForAnewWithEachText)
{
    this->Read("$(TEMP)/x");
    this->Read("$(TEMP)/y");
    EXPECT_EQ(this->ticket.TranslatorsAsked(), 2u);
}

TYPED_TEST(Decoding, Default_IsNeverResolved)
{
    EXPECT_EQ(this->ticket.GetWxStringParameter(-1, "missing", "$(TEMP)/x"), "$(TEMP)/x");
    this->Put("$(TEMP)/x");
    EXPECT_EQ(this->ticket.GetWxStringParameter(-1, "k", ""), "<$(TEMP)/x>");
}

TYPED_TEST(Decoding, Null_IsTheEmptyText) { EXPECT_EQ(this->ticket.Decode(nullptr), ""); }

TYPED_TEST(Decoding, TextGivenDirectly_IsResolvedToo)
{
    EXPECT_EQ(this->ticket.Decode("$(TEMP)/x"), "<$(TEMP)/x>");
    EXPECT_EQ(this->ticket.Decode("Gr\xC3\xBCn"), wxString::FromUTF8("Gr\xC3\xBCn"));
}
