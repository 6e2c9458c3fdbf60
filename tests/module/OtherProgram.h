// A second program on the site of a test: it carries out the steps of the history that are for it when it is
// asked to, and answers as MODULE_PROGRAM does. To be started before this process opens the site.
#pragma once

#include "tests/module/ModelStep.h"
#include "tests/support/ChildProcess.h"
#include <array>
#include <filesystem>

class OTHER_PROGRAM
{
public:
    static constexpr unsigned Patience = 300;  // seconds, after which it ends, whatever it waits for

    // The history outlives it.
    OTHER_PROGRAM(std::filesystem::path const& folder, std::vector<STEP> const& history);
    ~OTHER_PROGRAM();
    OTHER_PROGRAM(OTHER_PROGRAM const&) = delete;
    OTHER_PROGRAM& operator=(OTHER_PROGRAM const&) = delete;

    // Each throws std::runtime_error if the program is gone.
    std::string Run(std::size_t step) { return Ask(static_cast<int>(step)); }
    std::string News() { return Ask(AskForNews); }
    std::string Everything() { return Ask(AskForEverything); }

    void End();  // it is gone when this returns

private:
    enum : int
    {
        AskForNews = -1,
        AskForEverything = -2,
    };

    static void Serve(int channel, std::filesystem::path const& folder, std::vector<STEP> const& history);
    std::string Ask(int question);

    std::array<int, 2> m_channel;  // here, there
    ChildProcess m_program;
};
