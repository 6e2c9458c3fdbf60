#include "storageSupport.h"

#include <algorithm>
#include <bit>
#include <csignal>
#include <cstdlib>
#include <fstream>
#include <gtest/gtest.h>
#include <iterator>
#include <sys/wait.h>
#include <system_error>
#include <unistd.h>

TemporaryFolder::TemporaryFolder()
{
    // In memory if there is a place for it: these tests end processes, not the power, and a slow disk would
    // only leave fewer instants at which they can be ended.
    std::filesystem::path const memory = "/dev/shm";
    bool const hasMemory = access(memory.c_str(), W_OK) == 0;
    std::string pattern =
        ((hasMemory ? memory : std::filesystem::temp_directory_path()) / "comgui-test-XXXXXX").string();
    if (mkdtemp(pattern.data()) == nullptr)
        throw std::system_error(errno, std::generic_category(), pattern);
    m_path = pattern;
}

TemporaryFolder::~TemporaryFolder()
{
    std::error_code ignored;
    std::filesystem::remove_all(m_path, ignored);
}

std::vector<std::string> TemporaryFolder::Names() const
{
    std::vector<std::string> names;
    for (auto const& entry : std::filesystem::directory_iterator(m_path))
        names.push_back(entry.path().filename().string());
    std::sort(names.begin(), names.end());
    return names;
}

void WriteFile(std::filesystem::path const& file, std::string const& content)
{
    std::ofstream(file, std::ios::binary) << content;
}

std::string ContentOf(std::filesystem::path const& file)
{
    std::ifstream stream(file, std::ios::binary);
    EXPECT_TRUE(stream) << file;
    return {std::istreambuf_iterator<char>(stream), std::istreambuf_iterator<char>()};
}

std::mt19937_64 RandomFrom(unsigned seed) { return std::mt19937_64(seed); }

ChildProcess::ChildProcess(std::function<void(Report const& report)> const& work)
{
    int ends[2];
    if (pipe(ends) != 0)
        throw std::system_error(errno, std::generic_category(), "pipe");
    m_id = fork();
    if (m_id == 0)
    {
        close(ends[0]);
        int code = 0;
        try
        {
            work([&ends](std::int64_t number)
                 { static_cast<void>(write(ends[1], &number, sizeof(number)) == sizeof(number)); });
        }
        catch (...)
        {
            code = 1;
        }
        _exit(code);
    }
    close(ends[1]);
    m_reports = ends[0];
}

ChildProcess::~ChildProcess()
{
    Kill();
    close(m_reports);
}

void ChildProcess::Kill()
{
    if (m_id < 0)
        return;
    kill(m_id, SIGKILL);
    Wait();
}

int ChildProcess::Wait()
{
    int status = 0;
    waitpid(m_id, &status, 0);
    m_id = -1;
    return WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

bool ChildProcess::Next(std::int64_t& number)
{
    return read(m_reports, &number, sizeof(number)) == sizeof(number);
}

std::int64_t ChildProcess::Last(std::int64_t otherwise)
{
    while (Next(otherwise))
    {
    }
    return otherwise;
}

std::string NumberOfADeadProcess()
{
    ChildProcess child([](ChildProcess::Report const&) {});
    std::string const number = std::to_string(child.Id());
    child.Wait();
    return number;
}

bool SameValue(standin::StoredValue const& left, standin::StoredValue const& right)
{
    return left.type == right.type && left.integer == right.integer &&
           std::bit_cast<std::int64_t>(left.number) == std::bit_cast<std::int64_t>(right.number) &&
           left.bytes == right.bytes;
}
