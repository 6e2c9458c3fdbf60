#include "tools/ticketstream/StreamFile.h"

#include "tools/ticketstream/Output.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include <algorithm>
#include <cerrno>
#include <cstring>
#include <memory>

namespace ticketstream
{
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
    OpenFile file(std::fopen(name.c_str(), "wb"));
    if (!file)
        TellFailure(name, "written", "check the folder and the permissions");
    bool const isWritten = std::fwrite(bytes.data(), 1, bytes.size(), file.get()) == bytes.size();
    if (std::fclose(file.release()) != 0 || !isWritten)
        TellFailure(name, "written", "what is there now is not the whole stream; make room and try again");
}
}  // namespace ticketstream
