#include "tools/ticketstream/StreamFile.h"

#include "standin/server/files/AtomicFile.h"
#include "tools/shared/Output.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include <algorithm>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <memory>
#include <sys/stat.h>
#include <unistd.h>

namespace ticketstream
{
using tools::Output;

namespace
{
struct Close
{
    void operator()(std::FILE* file) const { static_cast<void>(std::fclose(file)); }
};
using OpenFile = std::unique_ptr<std::FILE, Close>;

[[noreturn]] void TellFailure(std::string const& name, char const* what, char const* remedy)
{
    throw Trouble(ShownName(name) + ": cannot be " + what + ": " + std::strerror(errno) + "; " + remedy);
}

void Overwrite(std::string const& file, std::string const& name, std::string_view bytes)
{
    OpenFile out(std::fopen(file.c_str(), "wb"));
    if (!out)
        TellFailure(name, "written", "check the folder and the permissions");
    bool const isWritten = std::fwrite(bytes.data(), 1, bytes.size(), out.get()) == bytes.size();
    if (std::fclose(out.release()) != 0 || !isWritten)
        TellFailure(name, "written", "make room and try again");
}

// Lets nobody end the program while there is a file that it would leave behind.
class HeldSignals
{
public:
    HeldSignals()
    {
        sigset_t ends;
        sigemptyset(&ends);
        for (int const end : {SIGINT, SIGTERM, SIGHUP, SIGQUIT})
            sigaddset(&ends, end);
        sigprocmask(SIG_BLOCK, &ends, &m_before);
    }
    HeldSignals(HeldSignals const&) = delete;
    HeldSignals& operator=(HeldSignals const&) = delete;
    ~HeldSignals() { sigprocmask(SIG_SETMASK, &m_before, nullptr); }

private:
    sigset_t m_before;
};

// It has to be one that may be written to, although its folder would do.
void Replace(std::string const& name, std::string_view bytes)
{
    if (access(name.c_str(), W_OK) != 0 && errno != ENOENT)
        TellFailure(name, "written", "check the folder and the permissions");
    HeldSignals const held;
    try
    {
        standin::ReplaceFile(name, bytes);
    }
    catch (standin::FileError const& error)
    {
        std::string text = error.what();
        if (text.starts_with(name))
            text.replace(0, name.size(), ShownName(name));
        throw Trouble(text);
    }
}

std::string ReadAll(std::FILE* file, std::string const& name, unsigned long limit)
{
    std::string bytes;
    char piece[1 << 16];
    while (bytes.size() < limit)
    {
        std::size_t const wanted = std::min(sizeof piece, limit - bytes.size());
        std::size_t const got = std::fread(piece, 1, wanted, file);
        bytes.append(piece, got);
        if (got < wanted && std::ferror(file))
            TellFailure(name, "read", "name a file, or - for standard input");
        if (got < wanted)
            break;
    }
    return bytes;
}
}  // namespace

std::string ReadFile(std::string const& name, unsigned long limit)
{
    if (name == "-")
        return ReadAll(stdin, name, limit);
    OpenFile const file(std::fopen(name.c_str(), "rb"));
    if (!file)
        TellFailure(name, "read", "check the name and the permissions");
    return ReadAll(file.get(), name, limit);
}

void WriteFile(std::string const& name, std::string_view bytes)
{
    if (name == "-")
    {
        Output out(stdout);
        out.Add(bytes);
        return out.Flush();
    }
    // What stands there, or nothing, until all of it is written; but what is no regular file is written as it
    // is.
    struct stat status = {};
    bool const isThere = stat(name.c_str(), &status) == 0;
    bool const isNew = !isThere && lstat(name.c_str(), &status) != 0 && !name.empty() && name.back() != '/';
    bool const isReplaced = isNew || (isThere && S_ISREG(status.st_mode));
    isReplaced ? Replace(name, bytes) : Overwrite(name, name, bytes);
}
}  // namespace ticketstream
