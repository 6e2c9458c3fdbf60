// The example with a window, as a program of its own beside a client that changes things. Run on a display.
#include "tests/client/Client.h"

#include "tests/support/Program.h"
#include <chrono>
#include <string>
#include <vector>

using namespace comgui;
using namespace std::chrono_literals;

namespace
{
class SmallDesk : public Client
{
protected:
    // Its window, and what it prints: the messages of its status bar, and the changes that it shows.
    struct Window : Program
    {
        explicit Window(std::vector<std::string> const& options) : Program(CommandOf(options)) {}

        bool Prints(std::string const& text)
        {
            for (auto const end = Clock::now() + 30s; auto const line = Line(end);)
                if (*line == text)
                    return true;
            return false;
        }

        static std::vector<std::string> CommandOf(std::vector<std::string> const& options)
        {
            std::vector<std::string> command{COMGUI_SMALL_DESK, "--trace"};
            command.insert(command.end(), options.begin(), options.end());
            return command;
        }
    };
};
}  // namespace

TEST_F(SmallDesk, ShowsWhatAnotherClientChanges)
{
    LogIn();
    ASSERT_TRUE(tickets.Write(System, "Test/First", 1));
    Window window({"--user", "admin", "--password", "admin", "--exit-after", "8000"});
    ASSERT_TRUE(window.Prints("Logged in: admin"));
    ASSERT_TRUE(window.Prints("Test/First = 1"));
    ASSERT_TRUE(tickets.Write(System, "Test/Number", 4711));
    EXPECT_TRUE(window.Prints("Test/Number = 4711"));
    ASSERT_TRUE(tickets.Write(System, "Test/List", MakeList<int>({1, 2, 3})));
    EXPECT_TRUE(window.Prints("Test/List = 1, 2, 3"));
    ASSERT_TRUE(tickets.Write(System, "Test/List", 9, 1));
    EXPECT_TRUE(window.Prints("Test/List = 1, 9, 3"));
    ASSERT_TRUE(tickets.Write(System, "Test/Number", Value()));
    EXPECT_TRUE(window.Prints("Test/Number = "));
    std::size_t count = 1;  // with the new one
    for (int const type : *tickets.Types())
        count += tickets.List(type)->size();
    ASSERT_TRUE(tickets.Create(JobTickets));
    EXPECT_TRUE(window.Prints("Tickets: " + std::to_string(count)));
    EXPECT_EQ(window.Wait(), 0);
}

TEST_F(SmallDesk, SaysWhyALoginIsRefused_AndAsksAgain)
{
    Window window({"--user", "nobody", "--password", "wrong", "--exit-after", "3000"});
    EXPECT_TRUE(window.Prints("nobody: wrong user or password"));
    EXPECT_EQ(window.Wait(), 0);
}

TEST_F(SmallDesk, HelpNeedsNoDisplay)
{
    unsetenv("DISPLAY");
    Program help({COMGUI_SMALL_DESK, "--help"});
    EXPECT_EQ(help.Line(Program::Clock::now() + 30s).value_or("").rfind("Usage: small_desk", 0), 0u);
    EXPECT_EQ(help.Wait(), 0);
}
