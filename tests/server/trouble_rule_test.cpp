// Rules of trouble as texts, and what they make of what happens.
#include "standin/server/trouble/Troubles.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <set>
#include <string>

using namespace standin;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;

namespace
{
std::string Canonical(char const* line) { return TroubleRule::Parse(line).Text(); }

std::string ErrorOf(char const* line)
{
    try
    {
        TroubleRule::Parse(line);
        return "none";
    }
    catch (TroubleError const& error)
    {
        return error.what();
    }
}

Occasion Read(TicketAddress ticket, char const* user = "admin")
{
    return {.call = "MGETPARAMETER", .ticket = ticket, .user = user};
}

bool IsFor(char const* line, Occasion const& occasion) { return TroubleRule::Parse(line).IsFor(occasion); }

// Which of the first calls of that many the rules refuse, 1 being the first.
std::vector<int> Refused(Troubles& troubles, int calls, Occasion const& occasion = Read({3, 1}))
{
    std::vector<int> refused;
    for (int i = 1; i <= calls; ++i)
        if (troubles.OnCall(occasion).code != 0)
            refused.push_back(i);
    return refused;
}
std::vector<int> Refused(char const* rules, int calls)
{
    Troubles troubles;
    troubles.Set(rules);
    return Refused(troubles, calls);
}

std::string Until(std::chrono::milliseconds fromNow)
{
    TroubleRule rule = TroubleRule::Parse("full");
    rule.until = TroubleRule::Clock::now() + fromNow;
    std::string const text = rule.Text();
    return text.substr(text.find(' '));
}
}  // namespace

TEST(TroubleRule, EveryWord_IsReadAndWritten)
{
    for (char const* line :
         {"fail", "fail call=MGET* ticket=3/12 user=admin code=-7 nth=2 share=12.5% seed=9 times=3",
          "delay call=remote.job.prepare ticket=17/* by=250ms", "away sessions=lost", "away sessions=kept",
          "late user=operator by=1500ms", "twice ticket=0/0", "lost share=100%", "swapped nth=1",
          "stall by=600000ms at=0.5% times=1", "full until=1795430400.050"})
        EXPECT_EQ(Canonical(line), line);
}

TEST(TroubleRule, Durations_HaveUnits)
{
    EXPECT_EQ(TroubleRule::Parse("delay by=250ms").by, 250ms);
    EXPECT_EQ(TroubleRule::Parse("delay by=2s").by, 2s);
    EXPECT_EQ(TroubleRule::Parse("delay by=10m").by, 10min);
    for (char const* line :
         {"delay by=2", "delay by=s", "delay by=11m", "delay by=-1s", "delay by=1h", "delay by=99999999999s"})
        EXPECT_THAT(ErrorOf(line), HasSubstr("a duration as 250ms, 2s or 1m")) << line;
}

TEST(TroubleRule, EndAfterADuration_IsOneFromNow)
{
    auto const before = TroubleRule::Clock::now();
    auto const rule = TroubleRule::Parse("away for=2s");
    ASSERT_TRUE(rule.until);
    EXPECT_GE(*rule.until, before + 2s - 1ms);
    EXPECT_LE(*rule.until, TroubleRule::Clock::now() + 2s);
    EXPECT_EQ(TroubleRule::Parse(rule.Text()).until, rule.until);
}

TEST(TroubleRule, BlanksBetweenWords_DoNotCount) { EXPECT_EQ(Canonical("  fail \t nth=2  "), "fail nth=2"); }

TEST(TroubleRule, Mistakes_AreTold)
{
    EXPECT_THAT(ErrorOf(""), HasSubstr("begin with fail, delay, away"));
    EXPECT_THAT(ErrorOf("Fail"), HasSubstr("\"Fail\": begin with fail"));
    EXPECT_THAT(ErrorOf("fail by=2s"), HasSubstr("fail takes call=, ticket=, user=, code=, nth="));
    EXPECT_THAT(ErrorOf("full nth=1"), HasSubstr("full takes for=, until="));
    EXPECT_THAT(ErrorOf("away user=admin"), HasSubstr("away takes sessions=, for=, until="));
    EXPECT_THAT(ErrorOf("stall by=1s ticket=3/1"), HasSubstr("stall takes by=, at=, nth="));
    EXPECT_THAT(ErrorOf("late call=MGETPARAMETER by=1s"), HasSubstr("late takes ticket="));
    EXPECT_THAT(ErrorOf("fail call"), HasSubstr("behind the equals sign"));
    EXPECT_THAT(ErrorOf("fail user="), HasSubstr("behind the equals sign"));
    EXPECT_THAT(ErrorOf("delay call=LoginEntry"), HasSubstr("say how long with by="));
    EXPECT_THAT(ErrorOf("delay by=0ms"), HasSubstr("say how long with by="));
    EXPECT_THAT(ErrorOf("fail call=GetParameter"), HasSubstr("no entry, slot or command is called that"));
    EXPECT_THAT(ErrorOf("away sessions=gone"), HasSubstr("sessions=kept or sessions=lost"));
    EXPECT_THAT(ErrorOf("fail code=0"), HasSubstr("a code other than 0"));
    EXPECT_THAT(ErrorOf("fail seed=x"), HasSubstr("a number"));
    EXPECT_THAT(ErrorOf("fail until=tomorrow"), HasSubstr("seconds since 1970"));
    EXPECT_THAT(ErrorOf("fail until=1e300"), HasSubstr("seconds since 1970"));
    for (char const* line : {"fail nth=0", "fail times=0", "fail nth=-1", "fail nth=2x"})
        EXPECT_THAT(ErrorOf(line), HasSubstr("a number from 1 on")) << line;
    for (char const* line : {"fail share=0%", "fail share=101%", "fail share=10", "fail share=nan%"})
        EXPECT_THAT(ErrorOf(line), HasSubstr("a percentage above 0% and up to 100%")) << line;
    for (char const* line : {"fail ticket=3", "fail ticket=3/", "fail ticket=x/1", "fail ticket=3/-1",
                             "fail ticket=100/1", "fail ticket=*/1"})
        EXPECT_THAT(ErrorOf(line), HasSubstr("ticket=TYPE/ID or ticket=TYPE/*")) << line;
}

TEST(TroubleRule, IsOneLineWithoutControlCharacters)
{
    for (char const* line : {"fail user=a\nfull", "fail\r", "fail user=\x1b[31m"})
        EXPECT_THAT(ErrorOf(line), HasSubstr("one line")) << line;
}

TEST(TroubleRule, WithoutWords_IsForEverything)
{
    EXPECT_TRUE(IsFor("fail", Read({3, 1})));
    EXPECT_TRUE(IsFor("fail", {}));
}

TEST(TroubleRule, Calls_AreNamesOrPatterns)
{
    EXPECT_TRUE(IsFor("fail call=MGETPARAMETER", Read({3, 1})));
    EXPECT_TRUE(IsFor("fail call=M*", Read({3, 1})));
    EXPECT_TRUE(IsFor("fail call=?GETPARAMETER", Read({3, 1})));
    EXPECT_FALSE(IsFor("fail call=MGETMULTIPAR", Read({3, 1})));
    EXPECT_FALSE(IsFor("fail call=S*", Read({3, 1})));
}

TEST(TroubleRule, Commands_AreCallsWithANameOfTheirOwn)
{
    Occasion const prepare{.call = "SendCommandEntry", .command = "remote.job.prepare"};
    EXPECT_TRUE(IsFor("fail call=remote.job.prepare", prepare));
    EXPECT_TRUE(IsFor("fail call=remote.*", prepare));
    EXPECT_TRUE(IsFor("fail call=SendCommandEntry", prepare));
    EXPECT_FALSE(IsFor("fail call=local.*", prepare));
}

TEST(TroubleRule, Tickets_AreOneOrAType)
{
    EXPECT_TRUE(IsFor("fail ticket=3/1", Read({3, 1})));
    EXPECT_FALSE(IsFor("fail ticket=3/1", Read({3, 2})));
    EXPECT_FALSE(IsFor("fail ticket=3/1", Read({7, 1})));
    EXPECT_TRUE(IsFor("fail ticket=3/*", Read({3, 2})));
    EXPECT_FALSE(IsFor("fail ticket=3/*", Read({7, 2})));
    EXPECT_FALSE(IsFor("fail ticket=0/0", {.call = "LoginEntry"}));
}

TEST(TroubleRule, User_IsThatOne)
{
    EXPECT_TRUE(IsFor("fail user=admin", Read({3, 1}, "admin")));
    EXPECT_FALSE(IsFor("fail user=admin", Read({3, 1}, "operator")));
    EXPECT_FALSE(IsFor("fail user=admin", {.call = "IsAliveEntry"}));
}

TEST(Troubles, Without_StrikeNobody)
{
    Troubles troubles;
    EXPECT_FALSE(troubles.Any());
    EXPECT_THAT(Refused(troubles, 3), ElementsAre());
    EXPECT_FALSE(troubles.IsAway());
    EXPECT_FALSE(troubles.IsDiskFull());
    EXPECT_FALSE(Troubles::None().Any());
}

TEST(Troubles, Code_IsThatOfTheRule)
{
    Troubles troubles;
    troubles.Set("fail call=MGETPARAMETER code=4711");
    EXPECT_TRUE(troubles.Any());
    EXPECT_EQ(troubles.OnCall(Read({3, 1})).code, 4711);
    EXPECT_EQ(troubles.OnCall({.call = "LoginEntry"}).code, 0);
    troubles.Set("fail");
    EXPECT_EQ(troubles.OnCall(Read({3, 1})).code, 112);
}

TEST(Troubles, Nth_IsThatOccasionOnly) { EXPECT_THAT(Refused("fail nth=2", 5), ElementsAre(2)); }

TEST(Troubles, Nth_CountsOccasionsOfTheRuleOnly)
{
    Troubles troubles;
    troubles.Set("fail ticket=3/1 nth=2");
    EXPECT_THAT(Refused(troubles, 3, Read({3, 2})), ElementsAre());
    EXPECT_THAT(Refused(troubles, 3, Read({3, 1})), ElementsAre(2));
}

TEST(Troubles, Times_AreTheMost) { EXPECT_THAT(Refused("fail times=2", 5), ElementsAre(1, 2)); }

TEST(Troubles, Share_IsDrawn_TheSameWayWithTheSameSeed)
{
    auto const refused = Refused("fail share=10% seed=7", 10'000);
    EXPECT_NEAR(static_cast<double>(refused.size()), 1000, 150);
    EXPECT_EQ(Refused("fail share=10% seed=7", 10'000), refused);
    EXPECT_NE(Refused("fail share=10% seed=8", 10'000), refused);
    EXPECT_EQ(Refused("fail share=100%", 100).size(), 100u);
}

TEST(Troubles, Delays_AddUp)
{
    Troubles troubles;
    troubles.Set("delay by=20ms\ndelay by=300ms call=M*\ndelay by=1m call=S*\n");
    EXPECT_EQ(troubles.OnCall(Read({3, 1})).delay, 320ms);
    EXPECT_EQ(troubles.OnCall(Read({3, 1})).code, 0);
}

TEST(Troubles, RuleThatIsThereAlready_GoesOnCounting)
{
    Troubles troubles;
    troubles.Set("fail nth=3");
    EXPECT_THAT(Refused(troubles, 1), ElementsAre());
    troubles.Set("twice\nfail nth=3");
    EXPECT_THAT(Refused(troubles, 2), ElementsAre(2));
    troubles.Set("");
    troubles.Set("fail nth=3");
    EXPECT_THAT(Refused(troubles, 3), ElementsAre(3));
}

TEST(Troubles, SameRuleTwice_CountsForItself)
{
    EXPECT_THAT(Refused("fail times=1\nfail times=1", 4), ElementsAre(1));
}

TEST(Troubles, LineThatIsNoRule_IsLeftOutAndTold)
{
    testing::internal::CaptureStderr();
    EXPECT_THAT(Refused("nonsense\n\n  \nfail times=1", 2), ElementsAre(1));
    std::string const told = testing::internal::GetCapturedStderr();
    EXPECT_THAT(told, HasSubstr("System/Trouble: a rule is left out: \"nonsense\""));
    EXPECT_EQ(std::count(told.begin(), told.end(), '\n'), 1);
}

TEST(Troubles, RuleEnds)
{
    EXPECT_THAT(Refused(("fail" + Until(-1ms)).c_str(), 1), ElementsAre());
    EXPECT_THAT(Refused(("fail" + Until(1h)).c_str(), 1), ElementsAre(1));
}

TEST(Troubles, RulesOfTheBeginning_GiveWayToNewerOnes)
{
    Troubles troubles;
    troubles.Begin("fail nth=1");
    EXPECT_THAT(Refused(troubles, 2), ElementsAre(1));
    troubles.Set("");
    troubles.Begin("fail");
    EXPECT_THAT(Refused(troubles, 2), ElementsAre());
}

TEST(Troubles, Away_EveryCallFails)
{
    Troubles troubles;
    troubles.Set("away\nfail code=4711");
    EXPECT_TRUE(troubles.IsAway());
    EXPECT_EQ(troubles.OnCall({.call = "LoginEntry"}).code, 106);
    EXPECT_TRUE(troubles.OnNotification({}).isLost);
}

TEST(Troubles, AwayWithItsSessions_LosesThoseThatWereOpen)
{
    Troubles troubles;
    troubles.NoteSession(4);
    troubles.NoteSession(3);
    troubles.Set("away sessions=kept");
    EXPECT_FALSE(troubles.HasLost(1));
    troubles.Set("away sessions=lost");
    troubles.NoteSession(5);
    EXPECT_TRUE(troubles.HasLost(4));
    EXPECT_FALSE(troubles.HasLost(5));
    troubles.Set("");
    EXPECT_TRUE(troubles.HasLost(4));
    EXPECT_FALSE(troubles.HasLost(5));
    EXPECT_TRUE(troubles.Any()) << "or nobody would ask";
    troubles.Set("away sessions=lost" + Until(-1ms));
    EXPECT_FALSE(troubles.HasLost(5)) << "it was over before it was heard of";
}

TEST(Troubles, Notifications_HaveRulesOfTheirOwn)
{
    Troubles troubles;
    Occasion const ofJob{.ticket = TicketAddress{3, 1}, .user = "admin"};
    Occasion const ofTransfer{.user = "admin"};
    troubles.Set("late by=2s user=admin\ntwice ticket=3/*\nlost ticket=7/1\nswapped nth=2");
    EXPECT_THAT(Refused(troubles, 3), ElementsAre());
    auto telling = troubles.OnNotification(ofJob);
    EXPECT_EQ(telling.late, 2s);
    EXPECT_TRUE(telling.isTwice);
    EXPECT_FALSE(telling.isLost);
    EXPECT_FALSE(telling.isSwapped);
    telling = troubles.OnNotification(ofTransfer);
    EXPECT_FALSE(telling.isTwice);
    EXPECT_TRUE(telling.isSwapped);
    EXPECT_TRUE(troubles.OnNotification({.ticket = TicketAddress{7, 1}}).isLost);
}

TEST(Troubles, Transfers_StandStillOnceTheyAreThatFar)
{
    Troubles troubles;
    EXPECT_EQ(troubles.OnTransfer().by, 0ms);
    troubles.Set("stall by=2s at=25% nth=2");
    EXPECT_EQ(troubles.OnTransfer().by, 0ms);
    auto const still = troubles.OnTransfer();
    EXPECT_EQ(still.by, 2s);
    EXPECT_EQ(still.at, 25);
}

TEST(Troubles, FirstStallThatStrikes_Counts)
{
    Troubles troubles;
    troubles.Set("stall by=1s at=75%\nstall by=2s at=25%");
    EXPECT_EQ(troubles.OnTransfer().by, 1s);
    EXPECT_EQ(troubles.OnTransfer().at, 75);
}

TEST(Troubles, Ignored_AreNone)
{
    Troubles troubles;
    troubles.Set("full");
    troubles.Ignore();
    EXPECT_FALSE(troubles.IsDiskFull());
    troubles.Set("full");
    EXPECT_FALSE(troubles.Any());
}

TEST(Troubles, LineThatIsNoRule_IsToldOnce)
{
    Troubles troubles;
    troubles.Set("nonsense");
    EXPECT_TRUE(troubles.Any()) << "or nobody would tell of it";
    testing::internal::CaptureStderr();
    troubles.OnCall({});
    troubles.OnCall({});
    std::string const told = testing::internal::GetCapturedStderr();
    EXPECT_EQ(std::count(told.begin(), told.end(), '\n'), 1);
    EXPECT_FALSE(troubles.Any());
}

TEST(Troubles, FullDisk_IsFullUntilTheRuleGoes)
{
    Troubles troubles;
    troubles.Set("full");
    EXPECT_TRUE(troubles.IsDiskFull());
    EXPECT_TRUE(troubles.IsDiskFull());
    troubles.Set("");
    EXPECT_FALSE(troubles.IsDiskFull());
}
