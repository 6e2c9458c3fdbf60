#include "tools/comgui_validate/Report.h"

#include "tools/comgui_validate/Contract.h"
#include "tools/shared/text.h"
#include <algorithm>
#include <nlohmann/json.hpp>
#include <pugixml.hpp>
#include <set>
#include <sstream>

namespace validate
{
namespace
{
using Json = nlohmann::ordered_json;

char const* NameOf(Outcome outcome)
{
    return outcome == Outcome::Passed ? "passed" : outcome == Outcome::Failed ? "failed" : "skipped";
}

auto CountOf(std::vector<Result> const& results, Outcome outcome)
{
    return std::count_if(results.begin(), results.end(),
                         [outcome](Result const& each) { return each.verdict.outcome == outcome; });
}

// What a plug-in has printed may be anything; a terminal gets it line by line and harmless.
std::string Indented(std::string const& text)
{
    std::string lines;
    std::istringstream source(text);
    for (std::string line; std::getline(source, line);)
        lines += "         | " + tools::ShownName(line) + '\n';
    return lines;
}

// JSON and XML must be UTF-8, and XML has no control characters.
std::string Harmless(std::string const& text)
{
    std::string harmless;
    std::istringstream source(text);
    for (std::string line; std::getline(source, line);)
        harmless += (harmless.empty() ? "" : "\n") + tools::ShownName(line);
    return harmless;
}
}  // namespace

std::string Lines(Result const& result, tools::Output const& output)
{
    Verdict const& verdict = result.verdict;
    switch (verdict.outcome)
    {
    case Outcome::Passed:
        return "passed   " + result.check + '\n';
    case Outcome::Skipped:
        return output.Painted(tools::Colour::Quiet, "skipped  " + result.check + ": " + verdict.reason) +
               '\n';
    default:
        return output.Painted(tools::Colour::Bad, "FAILED   " + result.check) + '\n' +                  //
               "         rule    " + verdict.broken.rule + ": " + TextOf(verdict.broken.rule) + '\n' +  //
               "         called  " + tools::ShownName(verdict.broken.called) + '\n' +                   //
               "         came    " + tools::ShownName(verdict.broken.came) + '\n' +                     //
               "         due     " + tools::ShownName(verdict.broken.due) + '\n' + Indented(verdict.output);
    }
}

std::string Summary(std::vector<Result> const& results)
{
    return std::to_string(results.size()) + " checks: " + std::to_string(CountOf(results, Outcome::Passed)) +
           " passed, " + std::to_string(CountOf(results, Outcome::Failed)) + " failed, " +
           std::to_string(CountOf(results, Outcome::Skipped)) + " skipped\n";
}

std::string ToJson(std::vector<Result> const& results, std::string const& bundle)
{
    Json all = Json::array();
    std::set<std::string> broken;
    for (auto const& [check, verdict] : results)
    {
        Json one{{"check", check}, {"outcome", NameOf(verdict.outcome)}, {"seconds", verdict.time.count()}};
        if (verdict.outcome == Outcome::Failed)
        {
            one["rule"] = verdict.broken.rule;
            one["text"] = TextOf(verdict.broken.rule);
            one["called"] = verdict.broken.called;
            one["came"] = verdict.broken.came;
            one["due"] = verdict.broken.due;
            one["output"] = Harmless(verdict.output);
            broken.insert(verdict.broken.rule);
        }
        else if (verdict.outcome == Outcome::Skipped)
            one["reason"] = verdict.reason;
        all.push_back(std::move(one));
    }
    Json const report{{"bundle", bundle},
                      {"passed", CountOf(results, Outcome::Passed)},
                      {"failed", CountOf(results, Outcome::Failed)},
                      {"skipped", CountOf(results, Outcome::Skipped)},
                      {"broken", broken},
                      {"checks", std::move(all)}};
    return report.dump(2, ' ', false, Json::error_handler_t::replace) + '\n';
}

std::string ToJUnit(std::vector<Result> const& results)
{
    pugi::xml_document document;
    auto suite = document.append_child("testsuites").append_child("testsuite");
    suite.append_attribute("name") = "comgui_validate";
    suite.append_attribute("tests") = static_cast<unsigned long>(results.size());
    suite.append_attribute("failures") = static_cast<long>(CountOf(results, Outcome::Failed));
    suite.append_attribute("skipped") = static_cast<long>(CountOf(results, Outcome::Skipped));
    for (auto const& [check, verdict] : results)
    {
        auto one = suite.append_child("testcase");
        auto const dot = check.find('.');
        one.append_attribute("classname") = check.substr(0, dot).c_str();
        one.append_attribute("name") = check.substr(dot + 1).c_str();
        one.append_attribute("time") = verdict.time.count();
        if (verdict.outcome == Outcome::Skipped)
            one.append_child("skipped").append_attribute("message") = verdict.reason.c_str();
        if (verdict.outcome != Outcome::Failed)
            continue;
        auto failure = one.append_child("failure");
        failure.append_attribute("type") = verdict.broken.rule.c_str();
        failure.append_attribute("message") =
            Harmless(verdict.broken.called + ": came " + verdict.broken.came + ", due " + verdict.broken.due)
                .c_str();
        failure.text() = (TextOf(verdict.broken.rule) + "\n" + Harmless(verdict.output)).c_str();
    }
    std::ostringstream text;
    document.save(text, "  ");
    return text.str();
}

bool HasFailure(std::vector<Result> const& results) { return CountOf(results, Outcome::Failed) != 0; }
}  // namespace validate
