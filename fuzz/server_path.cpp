// Paths on the server as clients write them, over a tree in memory with links that lead out of it. A text is
// taken just when a plain look at it, name by name, finds nothing wrong; and a folder is opened just when
// going there on foot, with a look at each step before it is taken, comes to the same folder.
#include "standin/server/transfer/ServerPath.h"

#include "fuzz/fuzz.h"
#include "standin/server/transfer/TransferError.h"
#include "tests/server/MemoryFolder.h"
#include <functional>
#include <sys/stat.h>

using namespace standin;
namespace fs = std::filesystem;

namespace
{
// The site with its folders, some links, and what lies outside of it. Made once.
class TREE
{
public:
    TREE()
    {
        for (char const* const name : {"site/temp/a/b", "site/job/1", "outside/a"})
            fs::create_directories(m_folder / name);
        m_folder.Write("site/temp/file", "content");
        m_folder.Write("outside/secret", "content");
        fs::create_directory_symlink("../../outside", m_folder / "site/temp/out");
        fs::create_directory_symlink("../..", m_folder / "site/temp/a/up");
        fs::create_directory_symlink(".", m_folder / "site/temp/here");
        fs::create_symlink("loop", m_folder / "site/temp/loop");
        fs::create_directory_symlink("temp", m_folder / "site/linked");
    }

    fs::path Of(std::string const& name) const { return m_folder / name; }

    // The table of a system ticket, with a folder of any name.
    FolderTable Table(std::string const& name) const
    {
        FolderSettings settings;
        auto const put = [&settings](std::string_view variable, std::string const& folder)
        {
            for (std::size_t row = 0; row < FolderRows.size(); ++row)
                if (FolderRows[row].variable == variable)
                    settings.values[row] = folder;
        };
        put("INSTALL", Of("site"));
        put("TEMP", "$(INSTALL)/temp");
        put("JOB", "$(INSTALL)\\job\\");
        put("PRINT", "$(INSTALL)/linked");
        put("LOG", "$(INSTALL)/none");
        put("EXPORT", "site/temp");
        put("PREVIEW", "$(JOB)/..");
        put("BACKUP", Of("site/temp/file"));
        put("HOT", Of(""));
        put("LOGO", Of("") / name);
        return FolderTable(settings.values);
    }

private:
    MemoryFolder m_folder;
};

TREE const& Tree()
{
    static TREE const tree;
    return tree;
}

// False if it is refused, which takes one of the results and one line.
bool IsDone(std::function<void()> const& work, std::initializer_list<TransferResult> refusals)
{
    try
    {
        work();
        return true;
    }
    catch (TransferError const& error)
    {
        std::string const line = error.what();
        auto const isControl = [](unsigned char byte) { return byte < 0x20 || byte == 0x7F; };
        COMGUI_MUST(!line.empty() && std::none_of(line.begin(), line.end(), isControl));
        COMGUI_MUST(std::find(refusals.begin(), refusals.end(), error.Result()) != refusals.end());
        return false;
    }
}

bool IsGoodName(std::string const& name)
{
    bool const isOfAPart = name.size() == 30 && name.starts_with(".transfer.") && name.ends_with(".tmp") &&
                           name.find_first_not_of("0123456789abcdef", 10) == 26;
    bool isGood = !name.empty() && name.size() < 256 && name != "." && name != ".." && !isOfAPart;
    for (char const byte : name)
        isGood = isGood && !(byte >= 0 && byte < ' ') && byte != '\x7F' && byte != '/' && byte != '\\';
    return isGood;
}

// Variable, folders and name; nothing for a text that is no place on the server.
std::vector<std::string> PartsOf(std::string const& text, std::string const& leaf)
{
    auto const end = text.find(')');
    if (text.compare(0, 2, "$(") != 0 || end == std::string::npos || end == 2)
        return {};
    std::vector<std::string> parts(1);
    for (char const byte : text.substr(end + 1))
        if (byte == '/' || byte == '\\')
            parts.emplace_back();
        else
            parts.back() += byte;
    if (!parts[0].empty())
        return {};
    if (parts.size() == 1)
        parts.emplace_back();
    if (parts.back().empty())
        parts.back() = leaf;
    if (!std::all_of(parts.begin() + 1, parts.end(), IsGoodName))
        return {};
    parts[0] = text.substr(2, end - 2);
    std::replace(parts[0].begin(), parts[0].end(), '\\', '/');
    return parts;
}

struct stat StateOf(fs::path const& folder)
{
    struct stat state = {};
    COMGUI_MUST(stat(folder.c_str(), &state) == 0);
    return state;
}

// The folder that the path means, nothing if it must not or cannot be opened.
std::optional<fs::path> ReachedOnFoot(ServerPath const& path, FolderTable const& table, Purpose purpose)
{
    auto const root = table.FolderOf(path.variable);
    std::error_code error;
    if (!root || !fs::path(*root).is_absolute() || !fs::is_directory(*root, error))
        return std::nullopt;
    auto const isKeptOut = [purpose](fs::path const& folder)
    {
        return fs::equivalent(folder, Tree().Of("site")) ||
               (purpose == Purpose::Write && fs::equivalent(folder, Tree().Of("site/job")));
    };
    fs::path folder = *root;
    if (isKeptOut(folder))
        return std::nullopt;
    for (std::string const& name : path.folders)
    {
        folder /= name;
        if (!fs::is_directory(fs::symlink_status(folder, error)) || isKeptOut(folder))
            return std::nullopt;
    }
    return folder;
}

void MustOpenWhatItMeans(ServerPath const& path, FolderTable const& table, Purpose purpose)
{
    auto const reached = ReachedOnFoot(path, table, purpose);
    Descriptor opened;
    bool const isOpened =
        IsDone([&] { opened = OpenFolderOf(path, table, purpose, Tree().Of("site")); },
               {PathRefused, purpose == Purpose::Read ? SourceUnreadable : TargetUnwritable});
    COMGUI_MUST(isOpened == reached.has_value());
    if (!isOpened)
        return;
    struct stat found = {};
    COMGUI_MUST(fstat(opened.Number(), &found) == 0);
    struct stat const expected = StateOf(*reached);
    COMGUI_MUST(found.st_dev == expected.st_dev && found.st_ino == expected.st_ino);
    // Below the variable's folder, wherever that is, with nothing but the names of the path in between.
    fs::path below = fs::canonical(*table.FolderOf(path.variable));
    for (std::string const& name : path.folders)
        below /= name;
    COMGUI_MUST(fs::canonical(*reached) == below);
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    INPUT input(data, size);
    std::string const leaf = input.Bytes(input.Among(20));
    std::string const folder = input.Text(input.Among(2) == 0 ? 0 : input.Among(30));
    std::string const text = input.Bytes(size);
    ServerPath path;
    bool const isTaken = IsDone([&] { path = ServerPath::Parse(text, leaf); }, {PathRefused});
    auto const parts = PartsOf(text, leaf);
    COMGUI_MUST(isTaken == !parts.empty());
    if (!isTaken)
        return 0;
    COMGUI_MUST(path.variable == parts[0] && path.name == parts.back());
    COMGUI_MUST(std::equal(path.folders.begin(), path.folders.end(), parts.begin() + 1, parts.end() - 1));
    FolderTable const table = Tree().Table(folder);
    MustOpenWhatItMeans(path, table, Purpose::Read);
    MustOpenWhatItMeans(path, table, Purpose::Write);
    return 0;
}
