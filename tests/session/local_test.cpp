// Ticket files: one-shot operations through the plug-in's factory.
#include "comgui/session/LocalTicket.h"

#include "comgui/session/ComGUIGlobals.h"
#include "comgui/session/ComGUIManager.h"
#include "tests/access/FolderVariablesFake.h"
#include "tests/session/FakeModule.h"
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <stdexcept>
#include <wx/filefn.h>

using comgui::test::CALL;
using comgui::test::SLOT;
using comgui::test::TicketFake;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
wxString const Path = wxString::FromUTF8("/jobs/Gr\xC3\xBCn\\a.xml");
char const PathInUtf8[] = "/jobs/Gr\xC3\xBCn\\a.xml";

// A manager whose factory makes one ticket.
class LocalTicket : public WithManager
{
protected:
    LocalTicket() { module.ticket = &file; }

    ~LocalTicket() override
    {
        int const opened = module.ticket ? static_cast<int>(module.paths.size()) : 0;
        EXPECT_EQ(module.destroyed, opened - leftOpen);  // each other ticket has been given back
    }

    template <typename Value>
    void Put(std::initializer_list<Value> values)
    {
        int pos = -1;
        for (Value const& value : values)
        {
            file.container.Put(0, 0, "k", value, pos);
            pos = pos == -1 ? 1 : pos + 1;
        }
    }

    std::vector<CALL> Writes() const
    {
        std::vector<CALL> writes;
        for (CALL const& call : file.container.calls)
            if (call.slot == SLOT::SET)
                writes.push_back(call);
        return writes;
    }

    static CALL Set(PARAM_TYPE type, int pos) { return {SLOT::SET, 0, 0, "k", type, pos}; }

    TicketFake file;
    int leftOpen = 0;
};

// The same with a factory that opens nothing.
class MissingFile : public LocalTicket
{
protected:
    MissingFile() { module.ticket = nullptr; }
};

using WithoutPlugIn = WithModule;

struct BrokenTranslator : FolderVariablesFake
{
    std::string Decode(std::string const&, bool) const override { throw std::runtime_error("broken"); }
};

std::vector<std::string> Values(wxArrayString const& array)
{
    std::vector<std::string> values;
    for (wxString const& text : array)
        values.push_back(text.utf8_string());
    return values;
}

std::vector<std::string> Values(wxStringList const& list)
{
    std::vector<std::string> values;
    for (wxStringListNode* node = list.GetFirst(); node; node = node->GetNext())
        values.push_back(wxString(node->GetData()).utf8_string());
    return values;
}
}  // namespace

TEST_F(LocalTicket, CreateTicket_HandsThePathToTheFactory)
{
    STICKET_ACCESS const* ticket = CreateTicket("a\\b");
    EXPECT_EQ(ticket, file.Access());
    DestroyTicket(ticket);
    EXPECT_EQ(ticket, nullptr);  // the factory clears the caller's pointer
    ticket = CreateTicket(nullptr);
    DestroyTicket(ticket);
    EXPECT_THAT(module.paths, ElementsAre("a\\b", "(null)"));
}

TEST_F(WithoutPlugIn, CreateTicket_IsNullAndDestroyTicketDoesNothing)
{
    hSTicketInstance = nullptr;
    EXPECT_EQ(CreateTicket("a"), nullptr);
    EXPECT_THAT(module.paths, IsEmpty());
    STICKET_ACCESS access = {};
    STICKET_ACCESS const* ticket = &access;
    DestroyTicket(ticket);
    EXPECT_EQ(ticket, &access);
    EXPECT_EQ(module.destroyed, 0);
}

TEST_F(LocalTicket, Path_GoesAsUtf8WithItsSeparatorsAsTheyAre)
{
    manager.GetIntParameterFromLocal(Path, "k", 5, -1);
    EXPECT_THAT(module.paths, ElementsAre(PathInUtf8));
}

TEST_F(LocalTicket, Int_IsReadAtItsPosition)
{
    Put({10, 20});
    EXPECT_EQ(manager.GetIntParameterFromLocal(Path, "k", 5, 1), 20);
    EXPECT_EQ(manager.GetIntParameterFromLocal(Path, "k", 5, 2), 5);
    EXPECT_EQ(manager.GetIntParameterFromLocal(Path, "missing", 5, -1), 5);
}

TEST_F(MissingFile, Reads_GiveTheirFixedValues)
{
    EXPECT_EQ(manager.GetIntParameterFromLocal(Path, "k", 5, -1), -1);  // and not the default
    EXPECT_EQ(manager.GetStringParameterFromLocal(Path, "k", -1), "");
    EXPECT_EQ(manager.GetDoubleParameterFromLocal(Path, "k"), -1.0);
    EXPECT_THAT(Values(manager.GetStringListParameterFromLocal(Path, "k")), IsEmpty());
    EXPECT_THAT(Values(manager.GetStringArrayParameterFromLocal(Path, "k")), IsEmpty());
    EXPECT_TRUE(manager.GetIntArrayParameterFromLocal(Path, "k").empty());
    EXPECT_TRUE(manager.GetDoubleArrayFromLocal(Path, "k").empty());
}

TEST_F(MissingFile, Writes_Give0)
{
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", wxString("x")), 0);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", wxString("x"), 0), 0);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", 1), 0);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", 1.0), 0);
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "x"), 0);
    EXPECT_EQ(manager.DeleteParameterFromLocal(Path, "k", -1), 0);
    EXPECT_EQ(module.destroyed, 0);
}

TEST_F(WithoutPlugIn, LocalOperations_GiveTheValuesOfAMissingFile)
{
    LoseTheBundle();
    testing::internal::CaptureStderr();
    ComGUIManager manager;
    testing::internal::GetCapturedStderr();
    EXPECT_EQ(manager.GetIntParameterFromLocal(Path, "k", 5, -1), -1);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", 1), 0);
}

TEST_F(LocalTicket, String_IsReadAtItsPosition)
{
    Put({"a", "Gr\xC3\xBCn"});
    EXPECT_EQ(manager.GetStringParameterFromLocal(Path, "k", 1), wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(manager.GetStringParameterFromLocal(Path, "missing", -1), "");
}

TEST_F(LocalTicket, String_IsResolvedIfTheTicketOffersATranslator)
{
    Put({"$(TEMP)/x"});
    FolderVariablesFake folders;
    file.container.folders = &folders;
    EXPECT_EQ(manager.GetStringParameterFromLocal(Path, "k", -1), "<$(TEMP)/x>");
    file.optionResult = 0;
    EXPECT_EQ(manager.GetStringParameterFromLocal(Path, "k", -1), "$(TEMP)/x");
}

TEST_F(LocalTicket, Double_IsReadAsTheKeyAsAWhole)
{
    Put({2.5});
    EXPECT_EQ(manager.GetDoubleParameterFromLocal(Path, "k"), 2.5);
    EXPECT_EQ(manager.GetDoubleParameterFromLocal(Path, "missing"), -1.0);
}

TEST_F(LocalTicket, Texts_EndAtTheFirstGapInBothForms)
{
    Put({"a", "b"});
    file.container.Put(0, 0, "k", "d", 3);
    EXPECT_THAT(Values(manager.GetStringListParameterFromLocal(Path, "k")), ElementsAre("a", "b"));
    EXPECT_THAT(Values(manager.GetStringArrayParameterFromLocal(Path, "k")), ElementsAre("a", "b"));
}

TEST_F(LocalTicket, Texts_AreResolvedOnTheirWay)
{
    Put({"$(TEMP)/x", "b"});
    FolderVariablesFake folders;
    file.container.folders = &folders;
    EXPECT_THAT(Values(manager.GetStringListParameterFromLocal(Path, "k")), ElementsAre("<$(TEMP)/x>", "b"));
    EXPECT_THAT(Values(manager.GetStringArrayParameterFromLocal(Path, "k")), ElementsAre("<$(TEMP)/x>", "b"));
}

TEST_F(LocalTicket, OperationThatThrows_LeavesItsTicketOpen_ByDesign)
{
    Put({"$(TEMP)/x"});
    BrokenTranslator folders;
    file.container.folders = &folders;
    EXPECT_THROW(manager.GetStringParameterFromLocal(Path, "k", -1), std::runtime_error);
    leftOpen = 1;
}

TEST_F(LocalTicket, IntArray_EndsAtAStoredMinus1_ByDesign)
{
    Put({3, -1, 7});
    wxArrayInt const array = manager.GetIntArrayParameterFromLocal(Path, "k");
    EXPECT_THAT(std::vector<int>(array.begin(), array.end()), ElementsAre(3));
}

TEST_F(LocalTicket, DoubleArray_GoesByTheCountAndKeepsMinus1)
{
    Put({3.0, -1.0, 7.0});
    wxArrayDouble const array = manager.GetDoubleArrayFromLocal(Path, "k");
    EXPECT_THAT(std::vector<double>(array.begin(), array.end()), ElementsAre(3.0, -1.0, 7.0));
}

TEST_F(LocalTicket, DoubleArray_HasMinus1WhereAReadFails)
{
    Put({3.0, 5.0, 7.0});
    file.container.FailPosition(1);
    wxArrayDouble const array = manager.GetDoubleArrayFromLocal(Path, "k");
    EXPECT_THAT(std::vector<double>(array.begin(), array.end()), ElementsAre(3.0, -1.0, 7.0));
}

TEST_F(LocalTicket, Arrays_OfAMissingKey_AreEmpty)
{
    EXPECT_TRUE(manager.GetIntArrayParameterFromLocal(Path, "k").empty());
    EXPECT_TRUE(manager.GetDoubleArrayFromLocal(Path, "k").empty());
}

TEST_F(LocalTicket, Writes_GoToTheirPositionAndGiveTheSlotsResult)
{
    file.container.success = 6;
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", wxString::FromUTF8("Gr\xC3\xBCn")), 6);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", wxString("y"), 1), 6);
    EXPECT_EQ(file.container.Text(0, 0, "k", 0), "Gr\xC3\xBCn");
    EXPECT_EQ(file.container.Text(0, 0, "k", 1), "y");
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", 5), 6);
    EXPECT_EQ(file.container.Int(0, 0, "k"), 5);
    EXPECT_EQ(manager.SetParameterToLocal(Path, "k", 2.5), 6);
    EXPECT_EQ(file.container.Double(0, 0, "k"), 2.5);
    EXPECT_EQ(manager.DeleteParameterFromLocal(Path, "k", 0), 6);
    EXPECT_EQ(file.container.Count(0, 0, "k"), 0u);
    EXPECT_THAT(Writes(), ElementsAre(Set(PARAM_STRING, -1), Set(PARAM_STRING, 1), Set(PARAM_INT, -1),
                                      Set(PARAM_DOUBLE, -1), Set(PARAM_NONE, 0)));
}

TEST_F(LocalTicket, AddString_ThatIsMissing_AppendsIt)
{
    Put({"a", "b"});
    file.container.success = 6;
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "c"), 6);
    EXPECT_THAT(Writes(), ElementsAre(Set(PARAM_STRING, -2)));
    EXPECT_EQ(file.container.Text(0, 0, "k", 2), "c");
}

TEST_F(LocalTicket, AddString_ThatDiffersInLetterCaseOnly_AppendsIt)
{
    Put({"a"});
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "A"), 1);
    EXPECT_EQ(file.container.Text(0, 0, "k", 1), "A");
}

TEST_F(LocalTicket, AddString_ThatIsThere_Gives0AndWritesNothing_ButReadsToTheEnd)
{
    Put({"a", "b", "c"});
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "a"), 0);
    EXPECT_THAT(Writes(), IsEmpty());
    EXPECT_EQ(file.container.calls.size(), 4u);
}

TEST_F(LocalTicket, AddString_IsComparedWithWhatAReadGives)
{
    Put({"$(TEMP)/x"});
    FolderVariablesFake folders;
    file.container.folders = &folders;
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "<$(TEMP)/x>"), 0);
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "$(TEMP)/x"), 1);
}

TEST_F(LocalTicket, AddString_ToAKeyWithoutValues_WritesTheFirst)
{
    EXPECT_EQ(manager.AddStringToStringListLocal(Path, "k", "a"), 1);
    EXPECT_THAT(Writes(), ElementsAre(Set(PARAM_STRING, -2)));
    EXPECT_EQ(file.container.Text(0, 0, "k", 0), "a");
}

namespace
{
class BackwardServer : public LocalTicket
{
protected:
    unsigned int NextBackwardPort()
    {
        TLogin other = {};
        manager.InitializeBackward(&other, 0);
        return other.iLocalPort;
    }

    TLogin login = {};
};
}  // namespace

TEST_F(BackwardServer, IsAliveBackward_TakesThePortFromTheSystemTicketsFile)
{
    file.container.Put(0, 0, "System/MasterSOAPPort", 4711);
    login.iServerPort = 1;
    std::strcpy(login.szServerHost, "server");
    EXPECT_EQ(manager.IsAliveBackward(&login), 0);
    EXPECT_THAT(module.paths, ElementsAre((wxGetCwd() + "\\tickets\\SYS_0000.xml").utf8_string()));
    EXPECT_EQ(login.iServerPort, 4711);
    EXPECT_EQ(module.port, 4711);
    EXPECT_EQ(module.host, "server");
    EXPECT_STREQ(login.szLocalAddress, "10.20.30.200");
    EXPECT_EQ(NextBackwardPort(), 4711u);
}

TEST_F(BackwardServer, IsAliveBackward_WithoutTheKey_KeepsTheRecordsPort)
{
    login.iServerPort = 4712;
    EXPECT_EQ(manager.IsAliveBackward(&login), 0);
    EXPECT_EQ(login.iServerPort, 4712);
    EXPECT_EQ(NextBackwardPort(), 4712u);
}

TEST_F(BackwardServer, IsAliveBackward_WithoutTheFile_AsksAtPortMinus1_ByDesign)
{
    module.ticket = nullptr;
    login.iServerPort = 4712;
    EXPECT_EQ(manager.IsAliveBackward(&login), 0);
    EXPECT_EQ(login.iServerPort, -1);
    EXPECT_EQ(module.port, -1);
    EXPECT_EQ(NextBackwardPort(), 0xFFFFFFFFu);
}

TEST_F(BackwardServer, IsAliveBackward_OfADeadServer_GivesMinus2005AndKeepsTheAddress)
{
    module.results["IsAliveEntry"] = 5;
    std::strcpy(login.szLocalAddress, "1.2.3.4");
    EXPECT_EQ(manager.IsAliveBackward(&login), -2005);
    EXPECT_STREQ(login.szLocalAddress, "1.2.3.4");
    EXPECT_EQ(module.calls.back(), "GetLocalAddressEntry");
}
