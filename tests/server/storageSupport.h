// What the tests of the server's files share: a folder that goes with its test, and a second process that
// can be killed at any instant.
#pragma once

#include "standin/server/StoredValue.h"
#include <cstdint>
#include <filesystem>
#include <functional>
#include <random>
#include <string>
#include <sys/types.h>
#include <vector>

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
inline constexpr bool IsSanitized = true;
#elif defined(__has_feature)
inline constexpr bool IsSanitized = __has_feature(address_sanitizer) || __has_feature(thread_sanitizer);
#else
inline constexpr bool IsSanitized = false;
#endif

class TemporaryFolder
{
public:
    TemporaryFolder();
    ~TemporaryFolder();
    TemporaryFolder(TemporaryFolder const&) = delete;
    TemporaryFolder& operator=(TemporaryFolder const&) = delete;

    std::filesystem::path operator/(std::string const& name) const { return m_path / name; }
    std::filesystem::path const& Path() const { return m_path; }
    std::vector<std::string> Names() const;  // what lies in it, sorted

private:
    std::filesystem::path m_path;
};

void WriteFile(std::filesystem::path const& file, std::string const& content);
std::string ContentOf(std::filesystem::path const& file);

// The same numbers in every run, so that what fails once fails again.
std::mt19937_64 RandomFrom(unsigned seed);

// A forked process that runs work and ends with 0, or with 1 after an exception.
class ChildProcess
{
public:
    // report tells the parent a number; what has been told is read even if the child dies thereafter.
    using Report = std::function<void(std::int64_t)>;
    explicit ChildProcess(std::function<void(Report const& report)> const& work);
    ~ChildProcess();
    ChildProcess(ChildProcess const&) = delete;
    ChildProcess& operator=(ChildProcess const&) = delete;

    pid_t Id() const { return m_id; }
    void Kill();                                // SIGKILL, and waits for the end
    int Wait();                                 // the exit code, -1 when a signal ended it
    bool Next(std::int64_t& number);            // waits for the next report; false at the end of them
    std::int64_t Last(std::int64_t otherwise);  // the last report, after the end of the process

private:
    pid_t m_id = -1;
    int m_reports = -1;
};

// As text, for the names of files that such a process may have left behind.
std::string NumberOfADeadProcess();

// Equal as bits, so that -0.0 differs from 0.0 and a NaN equals itself.
bool SameValue(standin::StoredValue const& left, standin::StoredValue const& right);
