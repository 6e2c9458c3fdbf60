// The page of rules and the program's checks know each other, and a good plug-in passes them all.
#include "comgui/testing/TemporaryFolder.h"
#include "tests/support/sanitizers.h"
#include "tools/comgui_validate/Check.h"
#include "tools/comgui_validate/Contract.h"
#include "tools/comgui_validate/Report.h"
#include "tools/comgui_validate/Run.h"
#include <algorithm>
#include <csignal>
#include <cstdlib>
#include <gmock/gmock.h>
#include <nlohmann/json.hpp>
#include <pugixml.hpp>
#include <set>
#include <stdexcept>
#include <string_view>
#include <unistd.h>

using comgui::test::TemporaryFolder;

namespace
{
using namespace validate;
using testing::HasSubstr;
using testing::IsEmpty;

std::set<std::string> NamesOfChecks()
{
    std::set<std::string> names;
    for (Check const& check : Checks())
        names.insert(check.name);
    return names;
}
}  // namespace

TEST(Contract, EachRule_HasAnOwnNameAndChecksThatExist)
{
    auto const checks = NamesOfChecks();
    std::set<std::string> names;
    for (Rule const& rule : Rules())
    {
        EXPECT_TRUE(names.insert(rule.name).second) << rule.name;
        EXPECT_FALSE(rule.text.empty()) << rule.name;
        EXPECT_FALSE(rule.checks.empty()) << rule.name;
        for (std::string const& check : rule.checks)
            EXPECT_EQ(checks.count(check), 1u) << rule.name << " names " << check;
    }
    EXPECT_GT(names.size(), 80u);
}

TEST(Contract, EachCheck_IsNamedByARule)
{
    std::set<std::string> named;
    for (Rule const& rule : Rules())
        named.insert(rule.checks.begin(), rule.checks.end());
    EXPECT_EQ(named, NamesOfChecks());
}

TEST(Contract, IsKeptByThePackagesOwnModule)
{
    TemporaryFolder const folder;
    setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
    Options options;
    options.bundle = COMGUI_BUNDLE;
    options.user = options.password = "admin";
    options.more["jobs"] = "yes";
    options.more["ticket-file"] = (folder / "site/tickets/SYS_0000.xml").string();
    options.limit = std::chrono::seconds(60);
    for (Check const& check : Checks())
    {
        Verdict const verdict = validate::Run(check, options);
        EXPECT_EQ(verdict.outcome, Outcome::Passed)
            << check.name << ": " << verdict.reason << verdict.broken.rule << ", called "
            << verdict.broken.called << ", came " << verdict.broken.came << ", due " << verdict.broken.due
            << verdict.output;
    }
}

TEST(Contract, WithoutAUser_SkipsWhatNeedsALogin)
{
    TemporaryFolder const folder;
    setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
    Options options;
    options.bundle = COMGUI_BUNDLE;
    auto const check =
        std::find_if(Checks().begin(), Checks().end(),
                     [](Check const& each) { return std::string_view(each.name) == "values.append"; });
    Verdict const verdict = validate::Run(*check, options);
    EXPECT_EQ(verdict.outcome, Outcome::Skipped);
    EXPECT_THAT(verdict.reason, HasSubstr("--user"));
}

// --- what the process of a check may do

namespace
{
Verdict RunThat(std::function<void()> const& work)
{
    Options options;
    options.limit = std::chrono::seconds(1);
    return validate::Run({"test.check", [&work](auto&) { work(); }}, options);
}
}  // namespace

TEST(ProcessOfACheck, ThatCrashes_IsAFailure)
{
    Verdict const verdict = RunThat([] { raise(SIGSEGV); });
    EXPECT_EQ(verdict.outcome, Outcome::Failed);
    EXPECT_EQ(verdict.broken.rule, "G1");
    EXPECT_THAT(verdict.broken.came, HasSubstr(IsSanitized ? "the process ended" : "Segmentation fault"));
}

TEST(ProcessOfACheck, ThatNeverEnds_IsAFailure)
{
    Verdict const verdict = RunThat([] { pause(); });
    EXPECT_EQ(verdict.broken.came, "no return within 1 s");
}

TEST(ProcessOfACheck, ThatEndsOfItself_IsAFailure)
{
    EXPECT_THAT(RunThat([] { _exit(3); }).broken.came, HasSubstr("status 3"));
    EXPECT_EQ(RunThat([] { _exit(0); }).broken.came, "the end of the process");
}

TEST(ProcessOfACheck, ThatCrashesAtItsEnd_IsAFailure)
{
    Verdict const verdict = RunThat([] { std::atexit([] { raise(SIGABRT); }); });
    EXPECT_EQ(verdict.outcome, Outcome::Failed);
    EXPECT_EQ(verdict.broken.called, "the end of the process");
}

TEST(ProcessOfACheck, ThatThrows_IsAFailure)
{
    EXPECT_THAT(RunThat([] { throw std::runtime_error("of the plug-in"); }).broken.came,
                HasSubstr("of the plug-in"));
    EXPECT_THAT(RunThat([] { throw 5; }).broken.came, HasSubstr("unknown type"));
}

TEST(ProcessOfACheck, WhatItPrints_IsKept)
{
    EXPECT_EQ(RunThat([] { std::puts("a word"); }).output, "a word\n");
}

// --- reports

namespace
{
std::vector<Result> const Results{
    {"values.append", {Outcome::Passed, {}, {}, {}, std::chrono::duration<double>(0.5)}},
    {"values.type", {Outcome::Failed, {"V7", "a call", "\x1B[2J<came>", "due"}, {}, "printed \x07\n", {}}},
    {"files.open", {Outcome::Skipped, {}, "no file", {}, {}}},
};
}  // namespace

TEST(ReportOfAValidation, AsText_SaysRuleCallAndDifference)
{
    tools::Output const plain;
    EXPECT_EQ(Lines(Results[0], plain), "passed   values.append\n");
    EXPECT_EQ(Lines(Results[2], plain), "skipped  files.open: no file\n");
    EXPECT_THAT(Lines(Results[1], plain),
                testing::AllOf(HasSubstr("FAILED   values.type"), HasSubstr(TextOf("V7")),
                               HasSubstr("a call"), testing::Not(HasSubstr("\x1B")),
                               testing::Not(HasSubstr("\x07"))));
    EXPECT_EQ(Summary(Results), "3 checks: 1 passed, 1 failed, 1 skipped\n");
    EXPECT_TRUE(validate::HasFailure(Results));
}

TEST(ReportOfAValidation, AsJson_HasCountsAndBrokenRules)
{
    auto const json = nlohmann::json::parse(ToJson(Results, "a bundle"));
    EXPECT_EQ(json["failed"], 1);
    EXPECT_EQ(json["broken"], nlohmann::json::array({"V7"}));
    EXPECT_EQ(json["checks"][1]["called"], "a call");
    EXPECT_EQ(json["checks"][2]["reason"], "no file");
}

TEST(ReportOfAValidation, AsJUnit_IsXml)
{
    pugi::xml_document document;
    ASSERT_TRUE(document.load_string(ToJUnit(Results).c_str()));
    auto const suite = document.child("testsuites").child("testsuite");
    EXPECT_STREQ(suite.attribute("failures").value(), "1");
    EXPECT_EQ(std::distance(suite.begin(), suite.end()), 3);
    EXPECT_STREQ(suite.find_child_by_attribute("name", "type").child("failure").attribute("type").value(),
                 "V7");
}
