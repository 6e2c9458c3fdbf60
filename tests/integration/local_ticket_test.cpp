// The local family of ComGUIManager on real ticket files, with no session anywhere.
#include "tests/integration/Host.h"
#include "tests/support/Files.h"
#include <gmock/gmock.h>

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
class LocalTicketFile : public Host
{
protected:
    void Write(std::string const& parameters) const
    {
        folder.Write("ticket.xml", "<ticket version='1'>" + parameters + "</ticket>");
    }

    std::string Content() const { return ContentOf(file.utf8_string()); }

    std::vector<std::string> Texts(char const* key) const
    {
        std::vector<std::string> texts;
        for (wxString const& text : Manager().GetStringArrayParameterFromLocal(file, key))
            texts.push_back(text.utf8_string());
        return texts;
    }

    wxString const file = wxString::FromUTF8((folder.Path() / "ticket.xml").string());
};
}  // namespace

TEST_F(LocalTicketFile, IntParameter_IsTheValueOrTheDefault)
{
    Write("<parameter key='I' type='int'><value pos='0'>7</value><value pos='1'>8</value></parameter>");
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "I", 5, -1), 7);
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "I", 5, 1), 8);
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "I", 5, 2), 5);
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "Missing", 5, -1), 5);
}

TEST_F(LocalTicketFile, MissingFile_GivesWhatEachMemberSaysThereAndIsNotMade_ByDesign)
{
    testing::internal::CaptureStderr();
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "K", 5, -1), -1);
    EXPECT_EQ(Manager().GetStringParameterFromLocal(file, "K", -1), "");
    EXPECT_EQ(Manager().GetDoubleParameterFromLocal(file, "K"), -1.0);
    EXPECT_EQ(Manager().GetStringListParameterFromLocal(file, "K").size(), 0u);
    EXPECT_EQ(Manager().GetStringArrayParameterFromLocal(file, "K").size(), 0u);
    EXPECT_EQ(Manager().GetIntArrayParameterFromLocal(file, "K").size(), 0u);
    EXPECT_EQ(Manager().GetDoubleArrayFromLocal(file, "K").size(), 0u);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "K", wxString("x")), 0);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "K", wxString("x"), 0), 0);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "K", 1), 0);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "K", 1.5), 0);
    EXPECT_EQ(Manager().AddStringToStringListLocal(file, "K", "x"), 0);
    EXPECT_EQ(Manager().DeleteParameterFromLocal(file, "K", -1), 0);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), IsEmpty());
    EXPECT_FALSE(std::filesystem::exists(folder.Path() / "ticket.xml"));
}

TEST_F(LocalTicketFile, StringParameter_ComesBackAsWritten)
{
    Write("");
    wxString const text = wxString::FromUTF8(" \xC3\xA4 <&> ");
    EXPECT_EQ(Manager().SetParameterToLocal(file, "S", text), 1);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "S", wxString("second"), 1), 1);
    EXPECT_EQ(Manager().GetStringParameterFromLocal(file, "S", -1), text);
    EXPECT_EQ(Manager().GetStringParameterFromLocal(file, "S", 1), "second");
    EXPECT_EQ(Manager().GetStringParameterFromLocal(file, "S", 2), "");
}

TEST_F(LocalTicketFile, FolderVariableInAText_StaysAsItIsWithoutATranslator)
{
    Write("<parameter key='S' type='string'>$(TEMP)/x</parameter>");
    EXPECT_EQ(Manager().GetStringParameterFromLocal(file, "S", -1), "$(TEMP)/x");
}

TEST_F(LocalTicketFile, NumbersComeBackAsWritten)
{
    Write("");
    EXPECT_EQ(Manager().SetParameterToLocal(file, "I", -7), 1);
    EXPECT_EQ(Manager().SetParameterToLocal(file, "D", 0.1), 1);
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "I", 5, -1), -7);
    EXPECT_EQ(Manager().GetDoubleParameterFromLocal(file, "D"), 0.1);
    EXPECT_EQ(Manager().GetDoubleParameterFromLocal(file, "I"), -1.0);  // nothing is converted
}

TEST_F(LocalTicketFile, StringListAndArray_EndAtAGap)
{
    Write("<parameter key='S' type='string'><value pos='0'>a</value><value pos='1'>b</value>"
          "<value pos='3'>d</value></parameter>");
    EXPECT_THAT(Texts("S"), ElementsAre("a", "b"));
    wxStringList const list = Manager().GetStringListParameterFromLocal(file, "S");
    ASSERT_EQ(list.size(), 2u);
    EXPECT_EQ(wxString(list.Item(0)->GetData()), "a");
    EXPECT_EQ(wxString(list.Item(1)->GetData()), "b");
}

TEST_F(LocalTicketFile, IntArray_EndsAtAMinus1AndTheDoubleArrayDoesNot_ByDesign)
{
    Write("<parameter key='I' type='int'><value pos='0'>3</value><value pos='1'>-1</value>"
          "<value pos='2'>7</value></parameter>"
          "<parameter key='D' type='double'><value pos='0'>3</value><value pos='1'>-1</value>"
          "<value pos='2'>7</value><value pos='4'>9</value></parameter>");
    wxArrayInt const ints = Manager().GetIntArrayParameterFromLocal(file, "I");
    EXPECT_THAT(std::vector<int>(ints.begin(), ints.end()), ElementsAre(3));
    wxArrayDouble const doubles = Manager().GetDoubleArrayFromLocal(file, "D");
    EXPECT_THAT(std::vector<double>(doubles.begin(), doubles.end()), ElementsAre(3.0, -1.0, 7.0, -1.0, 9.0));
}

TEST_F(LocalTicketFile, AddStringToStringList_AddsWhatIsNotThereYet)
{
    Write("");
    EXPECT_EQ(Manager().AddStringToStringListLocal(file, "S", "one"), 1);
    EXPECT_EQ(Manager().AddStringToStringListLocal(file, "S", "two"), 1);
    EXPECT_EQ(Manager().AddStringToStringListLocal(file, "S", "One"), 1);
    std::string const before = Content();
    EXPECT_EQ(Manager().AddStringToStringListLocal(file, "S", "one"), 0);
    EXPECT_EQ(Content(), before);
    EXPECT_THAT(Texts("S"), ElementsAre("one", "two", "One"));
}

TEST_F(LocalTicketFile, Delete_TakesOneValueOrTheKey)
{
    Write("<parameter key='S' type='string'><value pos='0'>a</value><value pos='1'>b</value></parameter>"
          "<parameter key='T' type='int'>1</parameter>");
    EXPECT_EQ(Manager().DeleteParameterFromLocal(file, "S", 1), 1);
    EXPECT_THAT(Texts("S"), ElementsAre("a"));
    EXPECT_EQ(Manager().DeleteParameterFromLocal(file, "S", -1), 1);
    EXPECT_THAT(Texts("S"), IsEmpty());
    EXPECT_EQ(Manager().GetIntParameterFromLocal(file, "T", 5, -1), 1);
}

TEST_F(LocalTicketFile, DamagedFile_CountsAsMissingAndIsTold)
{
    folder.Write("ticket.xml", "<ticket version='1'>");
    testing::internal::CaptureStderr();
    EXPECT_EQ(Manager().SetParameterToLocal(file, "K", 1), 0);
    EXPECT_THAT(testing::internal::GetCapturedStderr(), testing::HasSubstr("ticket.xml:1: "));
    EXPECT_EQ(Content(), "<ticket version='1'>");
}

TEST_F(LocalTicketFile, IsAliveBackward_TakesThePortFromTheSiteInTheCurrentFolder)
{
    std::filesystem::path const site = folder.Path() / "site";
    ASSERT_EQ(LogIn(), 0);  // the site is made
    int const port = 50123;
    ASSERT_EQ(Manager().SetParameter(0, 0, "System/MasterSOAPPort", PARAM_INT, &port, -1), 1);
    std::filesystem::current_path(site);
    TLogin login = Record();
    login.iServerPort = 1;
    EXPECT_EQ(Manager().IsAliveBackward(&login), 0);
    EXPECT_EQ(login.iServerPort, port);
}

TEST_F(LocalTicketFile, IsAliveBackward_WithoutASiteInTheCurrentFolder_AsksAtPortMinus1)
{
    std::filesystem::current_path(folder.Path());
    TLogin login = Record();
    EXPECT_EQ(Manager().IsAliveBackward(&login), -2005);
    EXPECT_EQ(login.iServerPort, -1);
}
