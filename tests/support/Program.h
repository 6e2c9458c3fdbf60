// A program that is started as a process of its own and spoken to in lines, by its standard input and output.
// Its stderr is that of whoever starts it. Unlike a copy of the process that starts it, it shares no library,
// no thread and no lock with that.
//
// For one thread at a time. The first object makes its process ignore SIGPIPE, since a program may be gone
// when it is spoken to; the programs themselves get the signal as usual.
#pragma once

#include <chrono>
#include <csignal>
#include <optional>
#include <string>
#include <string_view>
#include <sys/types.h>
#include <vector>

class Program
{
public:
    using Clock = std::chrono::steady_clock;

    // command: the path of the program, and its arguments. The environment is that of this process. Throws
    // std::system_error if there is no such program.
    explicit Program(std::vector<std::string> command);
    ~Program();  // SIGKILL, unless it has been waited for
    Program(Program const&) = delete;
    Program& operator=(Program const&) = delete;

    // The file of the process that calls, to start more of it.
    static std::string OwnFile();

    pid_t Id() const { return m_id; }
    int Output() const { return m_output; }  // the pipe that Line() reads, to wait for several at once

    // Sends a line. False if the program does not listen any more.
    bool Say(std::string_view line);

    // The next line that the program has written, without its end; nothing if none comes before the deadline,
    // or if the program has ended and all its lines are read. A line that the program's death cut is none.
    std::optional<std::string> Line(Clock::time_point deadline);
    bool HasEnded() const { return m_hasEnded; }  // Line() has seen the end of the output

    void Signal(int signal) const { kill(m_id, signal); }
    void Kill();  // SIGKILL, and waits for the end. Lines that were written before can still be read
    int Wait();   // for the end: the exit code, -1 when a signal ended it or it was waited for before

private:
    std::optional<std::string> TakeLine();

    pid_t m_id = -1;
    int m_input = -1;
    int m_output = -1;
    std::string m_text;  // read, and not yet given out
    std::size_t m_searched = 0;
    bool m_hasEnded = false;
};
