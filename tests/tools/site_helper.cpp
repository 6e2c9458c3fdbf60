// What the tests of comgui_site need beside it: a site to look after, another program that has it open, and a
// person at a terminal.
//
//     site_helper make SITE SEED            makes a site, as the first program that opens it does
//     site_helper hold SITE                 has it open with one session; says "open", leaves at the end of
//     input site_helper fits FOLDER USER PASSWORD  succeeds if that is the user's password site_helper put
//     FOLDER TYPE ID KEY BYTES  writes a text of whatever bytes, escaped as \xNN site_helper terminal
//     [ANSWER]... -- PROGRAM [ARGUMENT]...
//         runs the program on a terminal of its own, waits until it has turned the echo off and shown a
//         question
//         ("...: "), and types the next answer: with a return, or for ^C, ^D and ^Z the key alone. Prints all
//         that the terminal showed, then "echo on" or "echo off" as the program left it, and ends as the
//         program did, with 128 more than the number of a signal.
#include "standin/server/sessions/Password.h"
#include "standin/server/site/OpenStore.h"
#include "standin/server/site/Seed.h"
#include "tools/comgui_site/TicketCommits.h"
#include <algorithm>
#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <iostream>
#include <poll.h>
#include <pty.h>
#include <string>
#include <sys/wait.h>
#include <termios.h>
#include <unistd.h>
#include <vector>

namespace
{
using Words = std::vector<std::string>;

standin::StoreContent NoContent() { throw std::runtime_error("there is no site"); }

int Make(Words const& words)
{
    auto const name = standin::SiteName::Of(words.at(0));
    std::filesystem::create_directories(name.folder);
    OpenStore(name, [&] { return standin::Seed::Read(words.at(1)).Content(); })->Leave();
    return 0;
}

int Hold(Words const& words)
{
    auto const opened = OpenStore(standin::SiteName::Of(words.at(0)), NoContent);
    standin::SiteStore& store = *opened;
    store.OpenSession("admin");
    std::cout << "open" << std::endl;
    std::string line;
    while (std::getline(std::cin, line))
        store.Maintain(store.Committed());
    store.Leave();
    return 0;
}

int Fits(Words const& words)
{
    auto const opened = OpenStore(standin::SiteName::Of(words.at(0)), NoContent);
    standin::SiteStore& store = *opened;
    auto const user = store.FindUser(words.at(1));
    store.Leave();
    return user && standin::Password::Verify(words.at(2), user->passwordHash) ? 0 : 1;
}

std::string Unescaped(std::string const& text)
{
    std::string bytes;
    for (std::size_t i = 0; i < text.size(); ++i)
    {
        bool const isEscaped = text.compare(i, 2, "\\x") == 0;
        bytes += isEscaped ? static_cast<char>(std::stoi(text.substr(i + 2, 2), nullptr, 16)) : text[i];
        i += isEscaped ? 3 : 0;
    }
    return bytes;
}

int Put(Words const& words)
{
    auto const opened = OpenStore(standin::SiteName::Of(words.at(0)), NoContent);
    standin::SiteStore& store = *opened;
    std::string const bytes = Unescaped(words.at(4));
    standin::StoredValue value;
    value.type = PARAM_STRING;
    value.bytes = bytes;
    standin::TicketXml wanted;
    wanted.Put(Unescaped(words.at(3)), 0, value);
    comgui_site::TicketCommits commits(store);
    commits.Bring({std::stoi(words.at(1)), std::stoi(words.at(2))}, wanted,
                  comgui_site::TicketCommits::Mode::Merge);
    store.Leave();
    return 0;
}

class Terminal
{
public:
    explicit Terminal(Words words)
    {
        for (std::string& word : words)
            m_arguments.push_back(word.data());
        m_arguments.push_back(nullptr);
        m_program = forkpty(&m_terminal, nullptr, nullptr, nullptr);
        if (m_program == 0)
        {
            // A shell ignores some of them for what it runs in the background, and nohup one more.
            for (int const signal : {SIGINT, SIGQUIT, SIGHUP, SIGTERM, SIGTSTP, SIGTTOU, SIGTTIN})
                std::signal(signal, SIG_DFL);
            execv(m_arguments[0], m_arguments.data());
            _exit(127);
        }
    }

    // Until the program waits for keys, as a person would; the thread sanitizer loses a signal that comes
    // before. False if it has ended before it asked.
    bool WaitForQuestion()
    {
        while (HasEcho() || !m_shown.ends_with(": ") || !IsAsleep())
            if (!Read())
                return false;
        return true;
    }

    void Type(std::string const& answer)
    {
        bool const isKey = answer.size() == 2 && answer[0] == '^';
        std::string const keys = isKey ? std::string(1, static_cast<char>(answer[1] & 0x1F)) : answer + '\n';
        m_shown += "<";  // so that the same question is not taken for the next
        if (write(m_terminal, keys.data(), keys.size()) < 0)
            throw std::runtime_error("the terminal takes no keys");
    }

    int End()
    {
        while (Read())
            ;
        int status = 0;
        waitpid(m_program, &status, 0);
        bool const hasEcho = HasEcho();  // a terminal keeps its settings beyond the last program on it
        m_shown.erase(std::remove(m_shown.begin(), m_shown.end(), '\r'), m_shown.end());
        std::cout << m_shown << (hasEcho ? "echo on\n" : "echo off\n");
        return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    }

private:
    bool HasEcho() const
    {
        termios settings = {};
        return tcgetattr(m_terminal, &settings) == 0 && (settings.c_lflag & ECHO) != 0;
    }

    bool IsAsleep() const
    {
        std::ifstream status("/proc/" + std::to_string(m_program) + "/stat");
        std::string number, name, state;
        return status >> number >> name >> state && state == "S";
    }

    // False when the program has closed the terminal.
    bool Read()
    {
        pollfd looked{m_terminal, POLLIN, 0};
        poll(&looked, 1, 10);
        if (looked.revents == 0)
            return true;
        char text[256];
        ssize_t const size = read(m_terminal, text, sizeof text);
        m_shown.append(text, size > 0 ? static_cast<std::size_t>(size) : 0);
        return size > 0;
    }

    std::vector<char*> m_arguments;
    int m_terminal = -1;
    pid_t m_program = -1;
    std::string m_shown;
};

int OnTerminal(Words const& words)
{
    auto const end = std::find(words.begin(), words.end(), "--");
    Terminal terminal(Words(end + 1, words.end()));
    for (auto answer = words.begin(); answer != end && terminal.WaitForQuestion(); ++answer)
        terminal.Type(*answer);
    return terminal.End();
}
}  // namespace

int main(int argc, char** argv)
try
{
    Words const words(argv + std::min(argc, 2), argv + argc);
    std::string const verb = argc > 1 ? argv[1] : "";
    if (verb == "make")
        return Make(words);
    if (verb == "hold")
        return Hold(words);
    if (verb == "fits")
        return Fits(words);
    if (verb == "put")
        return Put(words);
    if (verb == "terminal")
        return OnTerminal(words);
    std::cerr << "site_helper: no such verb: " << verb << '\n';
    return 2;
}
catch (std::exception const& error)
{
    std::cerr << "site_helper: " << error.what() << '\n';
    return 2;
}
