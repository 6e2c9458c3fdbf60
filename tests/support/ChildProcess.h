// A copy of the test process that does something of its own and may be killed at any instant. To be started
// before the test itself uses the library: a copy shares no lock, no thread and no open site.
#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <sys/types.h>

class ChildProcess
{
public:
    // Tells the parent a number; what has been told can be read even if the child dies thereafter.
    using Report = std::function<void(std::int64_t number)>;

    // work runs in the child, which ends with 0 after it, or with 1 after an exception.
    explicit ChildProcess(std::function<void(Report const& report)> const& work);
    ~ChildProcess();
    ChildProcess(ChildProcess const&) = delete;
    ChildProcess& operator=(ChildProcess const&) = delete;

    pid_t Id() const { return m_id; }
    void Kill();                                // SIGKILL, and waits for the end
    int Wait();                                 // the exit code, -1 when a signal ended it
    std::optional<std::int64_t> Next();         // waits for the next report; none once the child has ended
    std::int64_t Last(std::int64_t otherwise);  // the last report, after the end of the process

private:
    pid_t m_id = -1;
    int m_reports = -1;
};
