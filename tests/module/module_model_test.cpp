// The whole face of the module against a plain model: random histories of what clients do, in two programs
// with several sessions, in which every answer and every notification must be the model's.
//
// A history that differs is made short and printed. COMGUI_MODULE_MODEL_SEED draws other histories,
// COMGUI_MODULE_MODEL_STEPS more or fewer steps. With COMGUI_MODULE_MODEL_KEEP, a list of numbers with commas
// between them, only those steps of the one history of the seed are carried out.
#include "tests/module/HistoryRun.h"
#include "tests/module/RandomHistory.h"
#include "tests/module/Shrinking.h"
#include "tests/support/sanitizers.h"
#include <chrono>
#include <cstdlib>
#include <gtest/gtest.h>
#include <sstream>

namespace
{
constexpr std::size_t StepsOfAHistory = 400;
constexpr std::size_t Steps = IsSanitized ? 4'000 : 10'000;  // each costs some ten times as much there
constexpr int Attempts = 2'000;                              // to make a history shorter, and
constexpr std::chrono::minutes Patience(2);                  // as long at most

using NUMBERS = std::vector<std::size_t>;

std::string From(char const* variable, std::string const& otherwise)
{
    char const* const text = std::getenv(variable);
    return text ? text : otherwise;
}

NUMBERS NumbersIn(std::string const& list)
{
    NUMBERS numbers;
    std::istringstream stream(list);
    for (std::string number; std::getline(stream, number, ',');)
        numbers.push_back(std::stoul(number));
    return numbers;
}

std::vector<STEP> Chosen(std::vector<STEP> const& history, NUMBERS const& numbers)
{
    std::vector<STEP> chosen;
    for (std::size_t const number : numbers)
        chosen.push_back(history.at(number));
    return chosen;
}

std::string Listed(std::vector<STEP> const& history, NUMBERS const& numbers)
{
    std::string text;
    std::string keep;
    for (std::size_t const number : numbers)
    {
        text += std::to_string(number) + ": " + LineOf(history[number]) + "\n";
        keep += (keep.empty() ? "" : ",") + std::to_string(number);
    }
    return text + "COMGUI_MODULE_MODEL_KEEP=" + keep + "\n";
}

// The history of a seed, reduced to what it takes, behind the difference that it was found by.
std::string Report(unsigned seed, std::vector<STEP> const& history, std::string const& difference)
{
    NUMBERS all(history.size());
    for (std::size_t i = 0; i < all.size(); ++i)
        all[i] = i;
    auto const end = std::chrono::steady_clock::now() + Patience;
    auto const fails = [&](NUMBERS const& numbers)
    { return std::chrono::steady_clock::now() < end && !DifferenceIn(Chosen(history, numbers)).empty(); };
    NUMBERS const numbers = Shrunk(all, fails, Attempts);
    return difference + "\n--- of these steps:\n" + Listed(history, numbers) +
           "COMGUI_MODULE_MODEL_SEED=" + std::to_string(seed) + "\n" + DifferenceIn(Chosen(history, numbers));
}
}  // namespace

TEST(ModuleModel, RandomHistories_AreAsThePlainModelHasThem)
{
    auto const seed = static_cast<unsigned>(std::stoul(From("COMGUI_MODULE_MODEL_SEED", "1")));
    std::size_t const steps = std::stoul(From("COMGUI_MODULE_MODEL_STEPS", std::to_string(Steps)));
    NUMBERS const keep = NumbersIn(From("COMGUI_MODULE_MODEL_KEEP", ""));
    if (!keep.empty())
    {
        auto const history = RandomHistory(seed, StepsOfAHistory);
        std::string const difference = DifferenceIn(Chosen(history, keep));
        EXPECT_TRUE(difference.empty()) << Listed(history, keep) << difference;
        return;
    }
    for (unsigned drawn = 0; drawn < steps / StepsOfAHistory; ++drawn)
    {
        auto const history = RandomHistory(seed + drawn, StepsOfAHistory);
        std::string const difference = DifferenceIn(history);
        ASSERT_TRUE(difference.empty()) << Report(seed + drawn, history, difference);
    }
}

TEST(Shrinking, LeavesWhatTheFailureTakes)
{
    std::vector<int> list(100);
    for (std::size_t i = 0; i < list.size(); ++i)
        list[i] = static_cast<int>(i);
    auto const fails = [](std::vector<int> const& some)
    {
        auto const has = [&](int number)
        { return std::find(some.begin(), some.end(), number) != some.end(); };
        return has(3) && has(50) && has(97);
    };
    EXPECT_EQ(Shrunk(list, fails, 1000), (std::vector<int>{3, 50, 97}));
}
