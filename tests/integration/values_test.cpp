// A host's lists, holders and variants, from the manager through the real bundle to the stand-in server, and
// back.
#include "tests/integration/Host.h"

#include <optional>
#include <string>

namespace
{
class ServerValues : public Host
{
protected:
    ServerValues()
    {
        EXPECT_EQ(LogIn(), 0);
        container = Manager().GetClientContainer();
        for (int pos = 0; pos < 5; ++pos)
            EXPECT_EQ(Manager().SetParameter(3, 1, Key, PARAM_INT, &pos, pos), 1);
    }

    ~ServerValues() override { values.DeleteContents(true); }

    void Add(wxVariant const& value) { values.Append(new wxVariant(value)); }

    // What a key holds at a position, by its type: -1 if there is nothing, or it is of another one.
    static int Int(int pos)
    {
        int value = -1;
        Manager().GetParameter(3, 1, Key, PARAM_INT, &value, pos);
        return value;
    }

    static std::optional<std::string> Text(int pos)
    {
        char const* text = nullptr;
        return Manager().GetParameter(3, 1, Key, PARAM_STRING, &text, pos) ? std::optional<std::string>(text)
                                                                           : std::nullopt;
    }

    int Count() const { return Manager().GetValueCount(container, 3, 1, Key); }

    static constexpr char const* Key = "Test/Values";
    MTICKET_ACCESS const* container = nullptr;
    wxList values;
};
}  // namespace

TEST_F(ServerValues, ListOfALongABoolAndAText_LeavesAGapInTheMiddle)
{
    Add(5L);
    Add(true);
    Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(Manager().SetMultiParameter(container, 3, 1, Key, values), 0);
    EXPECT_EQ(Count(), 3);
    EXPECT_EQ(Int(0), 5);
    EXPECT_EQ(MTICKET_READ::Of(container)->ParameterType(3, 1, Key, 1), PARAM_NONE);
    EXPECT_EQ(Text(2), "Gr\xC3\xBCn");
}

TEST_F(ServerValues, EmptyList_DeletesTheKey)
{
    EXPECT_EQ(Manager().SetMultiParameter(container, 3, 1, Key, values), 0);
    int type = 77;
    int elementType = 88;
    EXPECT_FALSE(Manager().GetKeyParameterType(container, 3, 1, Key, type, elementType));
    EXPECT_EQ(Count(), 0);
}

TEST_F(ServerValues, EmptyArray_DeletesTheKey)
{
    wxArrayString texts;
    EXPECT_EQ(Manager().SetArrayParameter(container, 3, 1, Key, texts), 0);
    EXPECT_EQ(Count(), 0);
}

TEST_F(ServerValues, ShorterArray_ReplacesTheKeyAndComesBackAsAVariant)
{
    wxArrayString texts;
    texts.Add("a");
    texts.Add(wxString::FromUTF8("Gr\xC3\xBCn"));
    EXPECT_EQ(Manager().SetArrayParameter(container, 3, 1, Key, texts), 0);
    wxVariant value;
    EXPECT_EQ(Manager().GetParameter(container, 3, 1, Key, value, -1), 1);
    EXPECT_EQ(value.GetArrayString(), texts);
}

TEST_F(ServerValues, RecordAtMinus1InTheMiddleOfATable_StartsTheKeyAnew)
{
    SETMULTIPAR_LIST list(false);
    list.SetParameter(Key, 70, 7);
    list.SetParameter(Key, 10, -1);
    list.SetParameter(Key, 30, 2);
    Manager().SetMultiParameter(3, 1, list);
    EXPECT_EQ(Count(), 3);
    EXPECT_EQ(Int(0), 10);
    EXPECT_EQ(Int(1), -1);
    EXPECT_EQ(Int(2), 30);
}

TEST_F(ServerValues, RefusedRecordOfATable_IsToldAndKeepsNoOtherBack)
{
    SETMULTIPAR_LIST list(false);
    list.SetParameter(Key, 10, 0);
    list.SetParameter(Key, 20, -3);  // no such position
    list.SetParameter(Key, 30, 2);
    Manager().SetMultiParameter(container, 3, 1, list);
    SETMULTIPAR const* const table = list.Table(false);
    EXPECT_NE(table[0].ok, 0);
    EXPECT_EQ(table[1].ok, 0);
    EXPECT_NE(table[2].ok, 0);
    EXPECT_EQ(Int(0), 10);
    EXPECT_EQ(Int(1), 1);
    EXPECT_EQ(Int(2), 30);
}

TEST_F(ServerValues, Holders_AreWrittenAndTheEmptyOneOfAnIntIsNot)
{
    int ten = 10;
    double half = 0.5;
    std::vector<SetDataHolder*> holders{new SetDataHolder(Key, PARAM_INT, &ten, -1), nullptr,
                                        new SetDataHolder(Key, PARAM_POINTER, nullptr, 1),
                                        new SetDataHolder(Key, PARAM_DOUBLE, &half, 2)};
    EXPECT_NE(Manager().SetMultiParameter(3, 1, 0, holders), 0);
    EXPECT_EQ(Count(), 3);
    EXPECT_EQ(Int(0), 10);
    EXPECT_EQ(MTICKET_READ::Of(container)->ParameterType(3, 1, Key, 1), PARAM_NONE);
    EXPECT_EQ(Manager().GetDoubleParameter(3, 1, 2, Key, 0), 0.5);
}

TEST_F(ServerValues, TypeOfAKey_IsTheCountAndTheTypeOfItsFirstValue)
{
    int type = 0;
    int elementType = 0;
    EXPECT_TRUE(Manager().GetKeyParameterType(container, 3, 1, Key, type, elementType));
    EXPECT_EQ(type, PARAM_COUNT);
    EXPECT_EQ(elementType, PARAM_INT);
}

TEST_F(ServerValues, MissingKey_IsTheLongMinus1)
{
    wxVariant value;
    EXPECT_EQ(Manager().GetParameter(container, 3, 1, "Test/Missing", value, -1), 1);
    EXPECT_EQ(value.GetType(), "long");
    EXPECT_EQ(value.GetLong(), -1);
}

TEST_F(ServerValues, DeletedValue_LeavesAGap)
{
    EXPECT_NE(Manager().DeleteParameter(3, 1, Key, 1), 0);
    EXPECT_EQ(Count(), 5);
    EXPECT_EQ(Int(1), -1);
    EXPECT_NE(Manager().DeleteParameter(container, 3, 1, Key, -1), 0);
    EXPECT_EQ(Count(), 0);
}

TEST_F(ServerValues, NewTicket_IsMadeOpenedClosedAndSeenInPart)
{
    char const* const keys[] = {"Seen/*", nullptr};
    int const job = Manager().CreateNextTicket(container, 3);
    ASSERT_GT(job, 0);
    EXPECT_TRUE(Manager().CreateOrOpenTicket(3, job, nullptr));
    EXPECT_NE(Manager().CloseTicket(container, 3, job), 0);
    int const number = 5;
    Manager().SetParameter(3, job, "Seen/Number", PARAM_INT, &number, -1);
    Manager().SetParameter(3, job, "Hidden/Number", PARAM_INT, &number, -1);
    EXPECT_NE(Manager().SetPartial(3, job, keys), 0);
    EXPECT_EQ(Manager().GetIntParameter(3, job, "Seen/Number", 0), 5);
    EXPECT_EQ(Manager().GetIntParameter(3, job, "Hidden/Number", 0), 0);
}

// The only test of this program to ask for such a path, since a manager looks at the folders once.
TEST_F(ServerValues, PathOfAServersFolder_IsResolvedWhileLoggedIn)
{
    EXPECT_EQ(Manager().GetDecodedPath("$(JOB)/1/x.pdf"), (folder.Path() / "site/job/1/x.pdf").string());
    Manager().Logout();
    EXPECT_EQ(Manager().GetDecodedPath("$(JOB)/1/x.pdf"), "");
}
