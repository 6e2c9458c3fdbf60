// The parts of a validation: what the user asks for, one check, and how a check ends early.
#pragma once

#include <chrono>
#include <functional>
#include <map>
#include <optional>
#include <stdexcept>
#include <string>
#include <vector>

namespace validate
{
class Trial;

struct Options
{
    std::string bundle;  // the folder
    std::string host = "localhost";
    int port = 50000;
    std::optional<std::string> user;  // without one, whatever needs a login is skipped
    std::string password;
    std::map<std::string, std::string> more;  // by name, as --option NAME=VALUE has them
    std::chrono::milliseconds limit = std::chrono::seconds(20);
};

// A name in --option, and what it does.
struct OptionName
{
    char const* name;
    char const* meaning;
};
std::vector<OptionName> const& OptionNames();

// name: "GROUP.WHAT". run returns if the plug-in keeps the rules, otherwise it throws one of those below.
struct Check
{
    char const* name;
    std::function<void(Trial&)> run;
};

// All of them, in the order in which they are to run.
std::vector<Check> const& Checks();

// A rule is broken. called: the call, as an author of a plug-in would write it.
struct Broken
{
    std::string rule;
    std::string called;
    std::string came;
    std::string due;
};

// The check has no meaning here; why, and what would give it one.
class Skipped : public std::runtime_error
{
public:
    using std::runtime_error::runtime_error;
};

std::vector<Check> BundleChecks();
std::vector<Check> ServerChecks();
std::vector<Check> SessionChecks();
std::vector<Check> ContainerChecks();
std::vector<Check> ValueChecks();
std::vector<Check> TableChecks();
std::vector<Check> WalkChecks();
std::vector<Check> TicketChecks();
std::vector<Check> NotificationChecks();
std::vector<Check> MemoryChecks();
std::vector<Check> CommandChecks();
std::vector<Check> TransferChecks();
std::vector<Check> ThreadChecks();
}  // namespace validate
