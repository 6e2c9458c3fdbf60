// A copy of the test process that does something of its own and may be killed in the middle of it. To be
// started before the test itself uses the library: a copy shares no lock, no thread and no open site.
#pragma once

#include <functional>
#include <optional>
#include <sys/types.h>

class ChildProcess
{
public:
    // work runs in the child, tells numbers to the parent by its argument, and the child ends with it.
    explicit ChildProcess(std::function<void(std::function<void(int)> const& tell)> const& work);
    ~ChildProcess();
    ChildProcess(ChildProcess const&) = delete;
    ChildProcess& operator=(ChildProcess const&) = delete;

    pid_t Id() const { return m_id; }
    std::optional<int> Next();  // waits for the next number; none once the child has ended
    void Kill();                // kill -9, and waits until it is gone

private:
    pid_t m_id;
    int m_numbers;
};
