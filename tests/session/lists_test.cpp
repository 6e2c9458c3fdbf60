// Lists, wx lists and arrays on their way to a ticket.
#include "comgui/session/ComGUIManager.h"

#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "tests/session/Faults.h"
#include "tests/session/Tickets.h"
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <memory>
#include <wx/debug.h>

using comgui::test::CALL;
using comgui::test::ContainerFake;
using comgui::test::SLOT;
using comgui::test::TicketFake;

using testing::ElementsAre;
using testing::IsEmpty;

namespace
{
// Both containers open tickets that take tables.
class Lists : public Tickets
{
protected:
    Lists()
    {
        for (auto* container : {&fake, &other})
        {
            container->AddTicket(3, 7);
            container->opened = ticket.Access();
        }
    }

    void FillList()
    {
        list.SetParameter("Z", 5, -1);
        list.SetParameter("A", wxString("text"), 0);
    }

    std::vector<CALL> Written() const { return ticket.container.calls; }

    SETMULTIPAR_LIST list{false};
    TicketFake ticket;
};

using ListsDeathTest = Lists;

auto const ListOfTwo = ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, "Z", PARAM_INT, -1},
                                   CALL{SLOT::SET, 0, 0, "A", PARAM_STRING, 0});
}  // namespace

TEST_F(Lists, GoIntoTheOpenedTicketInTheirOrderAndItStaysOpen)
{
    FillList();
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), ListOfTwo);
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(module.calls, IsEmpty());
}

TEST_F(Lists, SessionForm_FetchesTheContainerAnewKeepsItAndWritesThere)
{
    module.container = other.Access();
    FillList();
    manager.SetMultiParameter(3, 7, list);
    EXPECT_THAT(module.calls, ElementsAre("GetClientContainerEntry"));
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), ListOfTwo);
    EXPECT_FALSE(FakeIsTheContainer());
}

TEST_F(Lists, ListAfterwards_TellsWhatBecameOfEachRecord)
{
    FillList();
    ticket.container.FailPosition(0);
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    ASSERT_EQ(list.Size(), 2u);
    EXPECT_EQ(list.Table(false)[0].ok, 1);
    EXPECT_EQ(list.Table(false)[1].ok, 0);
}

TEST_F(Lists, EmptyList_OpensTheTicketAndWritesNothing)
{
    manager.SetMultiParameter(other.Access(), 3, 7, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), IsEmpty());
}

TEST_F(Lists, MissingTicket_IsNotWrittenTo)
{
    FillList();
    manager.SetMultiParameter(other.Access(), 3, 8, list);
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 8, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(), IsEmpty());
    EXPECT_EQ(list.Table(false)[0].ok, 0);
}

TEST_F(Lists, LoggedOut_DoNothing)
{
    manager.Logout();
    Reset();
    FillList();
    wxList values;
    wxArrayString texts;
    texts.Add("a");
    manager.SetMultiParameter(3, 7, list);
    for (MTICKET_ACCESS const* container :
         {static_cast<MTICKET_ACCESS const*>(other.Access()), static_cast<MTICKET_ACCESS const*>(nullptr)})
    {
        manager.SetMultiParameter(container, 3, 7, list);
        EXPECT_EQ(manager.SetMultiParameter(container, 3, 7, Key, values), 0);
        EXPECT_EQ(manager.SetArrayParameter(container, 3, 7, Key, texts), 0);
    }
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(fake.calls, IsEmpty());
    EXPECT_THAT(other.calls, IsEmpty());
}

TEST_F(ListsDeathTest, OfANullContainer_GoThroughNull_ByDesign)
{
    wxList values;
    wxArrayString texts;
    EXPECT_EXIT(manager.SetMultiParameter(nullptr, 3, 7, list), Faults, "");
    EXPECT_EXIT(manager.SetMultiParameter(nullptr, 3, 7, Key, values), Faults, "");
    EXPECT_EXIT(manager.SetArrayParameter(nullptr, 3, 7, Key, texts), Faults, "");
    module.container = nullptr;
    EXPECT_EXIT(manager.SetMultiParameter(3, 7, list), Faults, "");
}

namespace
{
// A value of a type that only its name tells from a text.
class OddlyNamed : public wxVariantData
{
public:
    explicit OddlyNamed(char const* typeName) : m_typeName(typeName) {}
    bool Eq(wxVariantData&) const override { return false; }
    wxString GetType() const override { return m_typeName; }
    bool Write(wxString& text) const override
    {
        text = "odd";
        return true;
    }

private:
    wxString m_typeName;
};

class ValueLists : public Lists
{
protected:
    void Add(wxVariant const& value)
    {
        owned.push_back(std::make_unique<wxVariant>(value));
        values.Append(owned.back().get());
    }

    int Set() { return manager.SetMultiParameter(other.Access(), 3, 7, Umlaut, values); }

    ContainerFake& Stored() { return ticket.container; }  // under 0/0

    std::vector<std::unique_ptr<wxVariant>> owned;
    wxList values;
    wxArrayString texts;
};

auto const OneDeletion =
    ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1});
}  // namespace

TEST_F(ValueLists, AreWrittenBehindADeletionOfTheKey)
{
    Add(5L);
    Add(2.5);
    Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(),
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_INT, 0},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_DOUBLE, 1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 2}));
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 5);
    EXPECT_EQ(Stored().Double(0, 0, Umlaut, 1), 2.5);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 2), "Gr\xC3\xBCn");
}

TEST_F(ValueLists, OldValuesBeyondTheNewOnes_AreGone)
{
    for (int pos = 0; pos < 5; ++pos)
        Stored().Put(0, 0, Umlaut, pos, pos);
    Add(7L);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 1u);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 7);
}

TEST_F(ValueLists, EmptyList_DeletesTheKey)
{
    Stored().Put(0, 0, Umlaut, 5);
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(Written(), OneDeletion);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}

TEST_F(ValueLists, OtherTypes_LeaveAGap)
{
    Add(5L);
    Add(true);
    Add("text");
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 5);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 1), std::nullopt);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 2), "text");
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 3u);
}

TEST_F(ValueLists, NullArraysAndLists_LeaveGapsAndNestedValuesAreNotWritten)
{
    wxVariant nested;
    nested.NullList();
    nested.Append(5L);
    texts.Add("a");
    Add(wxVariant());
    Add(nested);
    Add(texts);
    EXPECT_EQ(Set(), 0);
    EXPECT_THAT(Written(), OneDeletion);
}

TEST_F(ValueLists, Long_IsWrittenAsAnIntOfItsLow32Bits)
{
    Add(0x100000002L);
    EXPECT_EQ(Set(), 0);
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 0), 2);
}

TEST_F(ValueLists, TypeNames_CountInAnyLetterCase)
{
    Add(wxVariant(new OddlyNamed("StRiNg")));
    Add(wxVariant(new OddlyNamed("LONG")));
    Add(wxVariant(new OddlyNamed("Double")));
    Add(wxVariant(new OddlyNamed("strings")));
    auto const before = wxSetAssertHandler(nullptr);  // wxVariant complains that it makes no number of them
    EXPECT_EQ(Set(), 0);
    wxSetAssertHandler(before);
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 0), "odd");
    EXPECT_EQ(Stored().Int(0, 0, Umlaut, 1), 0);
    EXPECT_EQ(Stored().Double(0, 0, Umlaut, 2), 0.0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 3u);
}

TEST_F(ValueLists, FailureOfTheWrite_Is0AllTheSame_ByDesign)
{
    Add(5L);
    texts.Add("a");
    Stored().FailCall(0);
    EXPECT_EQ(Set(), 0);
    Stored().FailCall(0);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_EQ(manager.SetMultiParameter(other.Access(), 3, 8, Umlaut, values), 0);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 8, Umlaut, texts), 0);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}

TEST_F(ValueLists, SetArrayParameter_WritesEachTextBehindADeletionOfTheKey)
{
    Stored().Put(0, 0, Umlaut, 5, 4);
    texts.Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    texts.Add("");
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_THAT(module.calls, IsEmpty());
    EXPECT_THAT(WithoutAddresses(other.calls), ElementsAre(Operation(3, 7, MTICKET_OP_OPEN)));
    EXPECT_THAT(Written(),
                ElementsAre(CALL{SLOT::SETTABLE, 0, 0}, CALL{SLOT::SET, 0, 0, Umlaut, PARAM_NONE, -1},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 0},
                            CALL{SLOT::SET, 0, 0, Umlaut, PARAM_STRING, 1}));
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 0), "Gr\xC3\xBCn");
    EXPECT_EQ(Stored().Text(0, 0, Umlaut, 1), "");
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 2u);
}

TEST_F(ValueLists, SetArrayParameter_OfAnEmptyArray_DeletesTheKey)
{
    Stored().Put(0, 0, Umlaut, 5);
    EXPECT_EQ(manager.SetArrayParameter(other.Access(), 3, 7, Umlaut, texts), 0);
    EXPECT_THAT(Written(), OneDeletion);
    EXPECT_EQ(Stored().Count(0, 0, Umlaut), 0u);
}
