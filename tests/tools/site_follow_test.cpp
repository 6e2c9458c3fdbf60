#include "tools/comgui_site/follow.h"

#include "tests/tools/SiteTest.h"

using namespace comgui_site;
using namespace standin;
using testing::HasSubstr;

namespace
{
CommittedChange Change(TicketChange::Kind kind, std::vector<ParameterChange> parameters = {})
{
    CommittedChange change;
    change.sequence = 1042;
    change.program = 7;
    change.change.kind = kind;
    change.change.address = {3, 12};
    change.change.parameters = std::move(parameters);
    return change;
}

ParameterChange Parameter(std::string key, int pos, StoredValue const& value)
{
    return {std::move(key), pos, TicketValue::FromStored(value), true};
}

// A list of what cannot be copied.
template <typename... Parameters>
std::vector<ParameterChange> ListOf(Parameters... parameters)
{
    std::vector<ParameterChange> list;
    (list.push_back(std::move(parameters)), ...);
    return list;
}

using SiteFollow = SiteTest;
}  // namespace

TEST_F(SiteFollow, LineOf_AWrite_HasKeysAndValues)
{
    auto const change =
        Change(TicketChange::Write, ListOf(Parameter("Job/Copies", -1, Integer(PARAM_INT, 2)),
                                           Parameter("Inks", 3, Bytes(PARAM_STRING, "Cyan\x1B")),
                                           Parameter("Old", -1, {}), Parameter("Ids", 0, {})));
    EXPECT_EQ(LineOf(change, "desk 4711"),
              "1042  program 7 (desk 4711)  write  3/12  Job/Copies=2, Inks[3]=\"Cyan\\u001b\", Old deleted, "
              "Ids[0] deleted\n");
}

TEST_F(SiteFollow, LineOf_CreationAndDeletion)
{
    EXPECT_EQ(LineOf(Change(TicketChange::Create), ""), "1042  program 7  create  3/12\n");
    EXPECT_EQ(LineOf(Change(TicketChange::Delete), ""), "1042  program 7  delete  3/12\n");
}

TEST_F(SiteFollow, LineOf_ALongValue_IsCut)
{
    std::string const text(100'000, 'x');
    auto const change = Change(TicketChange::Write, ListOf(Parameter("a", -1, Bytes(PARAM_STRING, text))));
    EXPECT_LT(LineOf(change, "").size(), 200u);
    EXPECT_THAT(LineOf(change, ""), HasSubstr(" ... 100000 bytes"));
}

TEST_F(SiteFollow, JsonOf_AWrite_HasEveryValueWhole)
{
    std::string const text(1000, 'x');
    auto const change = Change(TicketChange::Write,
                               ListOf(Parameter("a", 2, Bytes(PARAM_STRING, text)), Parameter("b", -1, {})));
    Json const json = JsonOf(change, "desk 4711");
    EXPECT_EQ(json["sequence"], 1042);
    EXPECT_EQ(json["programName"], "desk 4711");
    EXPECT_EQ(json["kind"], "write");
    EXPECT_EQ(json["type"], 3);
    EXPECT_EQ(json["id"], 12);
    EXPECT_EQ(json["parameters"][0]["pos"], 2);
    EXPECT_EQ(json["parameters"][0]["value"], text);
    EXPECT_EQ(json["parameters"][1]["deleted"], true);
}

TEST_F(SiteFollow, ProgramNames_OfTheLivingAndTheUnknown)
{
    MemoryStore other(site, "desk\n");
    ProgramNames names(store);
    EXPECT_THAT(names.Of(other.Self()), HasSubstr("desk\\x0a "));
    EXPECT_EQ(names.Of(99), "");
}

TEST_F(SiteFollow, Follow_SinceWhatIsNotThereYet_IsTrouble)
{
    tools::Output out;
    EXPECT_EQ(TroubleOf([&] { Follow(store, store.Committed() + 1, false, out); }),
              "there is no change " + std::to_string(store.Committed() + 1) + " yet; the newest is " +
                  std::to_string(store.Committed()));
}
