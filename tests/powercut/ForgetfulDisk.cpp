#include "tests/powercut/ForgetfulDisk.h"

#include "tests/support/Files.h"
#include <algorithm>
#include <cstring>
#include <stdexcept>
#include <sys/stat.h>
#include <utility>

namespace fs = std::filesystem;

namespace
{
std::uint64_t InodeOf(fs::path const& file)
{
    struct stat found = {};
    if (lstat(file.c_str(), &found) != 0)
        throw std::runtime_error(file.string() + ": cannot be looked at");
    return found.st_ino;
}

void Put(std::string& content, std::size_t offset, std::string_view bytes)
{
    content.resize(std::max(content.size(), offset + bytes.size()), '\0');
    std::copy(bytes.begin(), bytes.end(), content.begin() + static_cast<std::ptrdiff_t>(offset));
}
}  // namespace

std::vector<DiskRecord> ReadDiskLog(fs::path const& file)
{
    std::string const log = ContentOf(file);
    std::vector<DiskRecord> records;
    std::size_t at = 0;
    auto const take = [&](std::size_t size)
    {
        if (size > log.size() - at)
            throw std::runtime_error(file.string() + ": ends in the middle of a record");
        return std::string_view(log).substr(std::exchange(at, at + size), size);
    };
    while (at < log.size())
    {
        DiskRecord record;
        std::memcpy(&record.head, take(sizeof record.head).data(), sizeof record.head);
        record.path = take(record.head.pathSize);
        record.other = take(record.head.otherSize);
        record.data = take(record.head.dataSize);
        records.push_back(std::move(record));
    }
    return records;
}

char const* NameOf(Survivors survivors)
{
    constexpr char const* Names[] = {"Nothing", "NamesAlone", "InOrder", "AnySubset", "Everything"};
    return Names[static_cast<int>(survivors)];
}

// What one power cut is like.
struct ForgetfulDisk::Chance
{
    Survivors survivors;
    std::size_t grain;  // what a drive writes as one
    double kept;        // how likely a piece is
};

// --- replaying

ForgetfulDisk::ForgetfulDisk(fs::path const& folder) : m_root(folder.string())
{
    TakeIn(folder, Add(true, InodeOf(folder)));
    for (Node node = 0; node < m_nodes.size(); ++node)
        m_flushed[node] = m_nodes[node].entries;
}

void ForgetfulDisk::TakeIn(fs::path const& folder, Node node)
{
    for (auto const& entry : fs::directory_iterator(folder))
    {
        Node const child = Add(entry.is_directory(), InodeOf(entry.path()));
        m_nodes[node].entries[entry.path().filename().string()] = child;
        if (entry.is_directory())
            TakeIn(entry.path(), child);
        else
            m_nodes[child].flushed = m_nodes[child].current = ContentOf(entry.path());
        NoteContents(entry.path().string(), child);
    }
}

ForgetfulDisk::Node ForgetfulDisk::Add(bool isFolder, std::uint64_t inode)
{
    m_nodes.emplace_back().isFolder = isFolder;
    m_byInode[inode] = m_nodes.size() - 1;
    return m_nodes.size() - 1;
}

ForgetfulDisk::Node ForgetfulDisk::Find(std::uint64_t inode) const
{
    auto const found = m_byInode.find(inode);
    if (found == m_byInode.end())
        throw std::runtime_error("the log writes to a file that nothing has made");
    return found->second;
}

// Where the path leads now; to is 0 if nothing has that name.
ForgetfulDisk::Entry ForgetfulDisk::Resolve(std::string const& path) const
{
    fs::path const relative = fs::path(path).lexically_relative(m_root);
    Node folder = 0;
    for (fs::path const& part : relative.parent_path())
        folder = m_nodes.at(folder).entries.at(part.string());
    std::string const name = relative.filename().string();
    auto const found = m_nodes[folder].entries.find(name);
    return {folder, name, found == m_nodes[folder].entries.end() ? 0 : found->second};
}

void ForgetfulDisk::Replay(DiskRecord const& record)
{
    DiskRecordHead const& head = record.head;
    switch (head.call)
    {
    case DiskCall::Mark:
        return;
    case DiskCall::MakeFile:
    case DiskCall::MakeFolder:
    {
        Entry entry = Resolve(record.path);
        entry.to = Add(head.call == DiskCall::MakeFolder, head.file);
        return Change(entry.to, {entry});
    }
    case DiskCall::Write:
        return Apply(Find(head.file), {static_cast<std::size_t>(head.offset), record.data});
    case DiskCall::Grow:
        if (static_cast<std::size_t>(head.offset) <= m_nodes[Find(head.file)].current.size())
            return;
        [[fallthrough]];
    case DiskCall::Resize:
        return Apply(Find(head.file), {static_cast<std::size_t>(head.offset), {}});
    case DiskCall::Rename:
    {
        Entry const from = Resolve(record.path);
        Entry const to = Resolve(record.other);
        Change(from.to, {{from.folder, from.name, 0}, {to.folder, to.name, from.to}});
        return NoteContents(record.other, from.to);
    }
    case DiskCall::Remove:
    {
        Entry const entry = Resolve(record.path);
        return Change(entry.to, {{entry.folder, entry.name, 0}});
    }
    case DiskCall::BeginFlush:
        return BeginFlush(Find(head.file), head.offset);
    case DiskCall::Flush:
        return EndFlush(head.offset);
    case DiskCall::Unknown:
        break;
    }
    throw std::runtime_error("the model knows nothing of this: " + record.path);
}

void ForgetfulDisk::Change(Node subject, std::vector<Entry> entries)
{
    if (subject == 0)
        throw std::runtime_error("the log changes a name that nothing has");
    for (Entry const& entry : entries)
        if (entry.to == 0)
            m_nodes[entry.folder].entries.erase(entry.name);
        else
            m_nodes[entry.folder].entries[entry.name] = entry.to;
    m_changes.push_back({subject, std::move(entries)});
}

void ForgetfulDisk::Apply(Node node, Write write)
{
    File& file = m_nodes[node];
    if (write.data.empty())
        file.current.resize(write.offset, '\0');
    else
        ::Put(file.current, write.offset, write.data);
    file.pending.push_back(std::move(write));
}

void ForgetfulDisk::BeginFlush(Node node, std::int64_t number)
{
    File const& file = m_nodes[node];
    m_flushes[number] = {node, file.current,
                         file.isFolder ? m_changes.size() : file.flushedWrites + file.pending.size()};
}

void ForgetfulDisk::EndFlush(std::int64_t number)
{
    auto const flush = m_flushes.extract(number);
    if (!flush)
        throw std::runtime_error("the log ends a flush that has not begun");
    m_nodes[flush.mapped().node].isFolder ? FlushFolder(flush.mapped()) : FlushFile(flush.mapped());
}

void ForgetfulDisk::FlushFile(RunningFlush const& flush)
{
    File& file = m_nodes[flush.node];
    if (flush.taken <= file.flushedWrites)
        return;  // one that began later was faster
    auto const count = static_cast<std::ptrdiff_t>(flush.taken - file.flushedWrites);
    file.pending.erase(file.pending.begin(), file.pending.begin() + count);
    file.flushedWrites = flush.taken;
    file.flushed = flush.content;
}

// A name that is certain makes certain what led there: the earlier changes of the same file or folder.
void ForgetfulDisk::FlushFolder(RunningFlush const& flush)
{
    std::set<Node> certain;
    for (std::size_t i = flush.taken; i > 0; --i)
    {
        NameChange& change = m_changes[i - 1];
        bool const isHere = std::any_of(change.entries.begin(), change.entries.end(),
                                        [&](Entry const& entry) { return entry.folder == flush.node; });
        if (isHere || certain.contains(change.subject))
        {
            change.isFlushed = true;
            certain.insert(change.subject);
        }
    }
}

void ForgetfulDisk::NoteContents(std::string const& path, Node node)
{
    if (!m_nodes[node].isFolder)
        m_contents[fs::path(path).lexically_relative(m_root).string()].insert(m_nodes[node].current);
}

std::set<std::string> const& ForgetfulDisk::ContentsOf(std::string const& name) const
{
    static std::set<std::string> const none;
    auto const found = m_contents.find(name);
    return found == m_contents.end() ? none : found->second;
}

// --- forgetting

// Of each change of a name, whether it has reached the disk.
std::vector<bool> ForgetfulDisk::Kept(Survivors survivors, Random& random) const
{
    std::vector<bool> kept;
    for (NameChange const& change : m_changes)
        kept.push_back(change.isFlushed || survivors == Survivors::NamesAlone ||
                       survivors == Survivors::Everything);
    if (survivors == Survivors::InOrder)
    {
        auto const lastCertain =
            static_cast<std::size_t>(std::find(kept.rbegin(), kept.rend(), true).base() - kept.begin());
        std::size_t const end = std::uniform_int_distribution(lastCertain, kept.size())(random);
        std::fill_n(kept.begin(), end, true);
    }
    if (survivors == Survivors::AnySubset)
    {
        std::set<Node> lost;
        for (std::size_t i = 0; i < kept.size(); ++i)
        {
            kept[i] = kept[i] || (!lost.contains(m_changes[i].subject) && random() % 2 == 0);
            if (!kept[i])
                lost.insert(m_changes[i].subject);
        }
    }
    return kept;
}

std::string ForgetfulDisk::Content(File const& file, Chance const& chance, Random& random) const
{
    if (chance.survivors == Survivors::Everything)
        return file.current;
    std::string content = file.flushed;
    if (chance.survivors == Survivors::Nothing || chance.survivors == Survivors::NamesAlone)
        return content;
    bool const isInOrder = chance.survivors == Survivors::InOrder;
    std::bernoulli_distribution isKept(chance.kept);
    std::size_t const end = std::uniform_int_distribution<std::size_t>(0, file.pending.size())(random);
    for (std::size_t i = 0; i < (isInOrder ? std::min(end + 1, file.pending.size()) : file.pending.size());
         ++i)
    {
        Write const& write = file.pending[i];
        bool const isWhole = isInOrder && i < end;
        if (write.data.empty() && (isWhole || isKept(random)))
            content.resize(write.offset, '\0');
        for (std::size_t at = 0; at < write.data.size();)
        {
            std::size_t const place = write.offset + at;
            std::size_t const size = std::min(chance.grain - place % chance.grain, write.data.size() - at);
            if (isWhole || isKept(random))
                ::Put(content, place, std::string_view(write.data).substr(at, size));
            at += size;
        }
    }
    return content;
}

void ForgetfulDisk::Put(fs::path const& target, Folders const& folders, Node folder, Chance const& chance,
                        Random& random) const
{
    fs::create_directory(target);
    auto const entries = folders.find(folder);
    if (entries == folders.end())
        return;
    for (auto const& [name, node] : entries->second)
        if (m_nodes[node].isFolder)
            Put(target / name, folders, node, chance, random);
        else
            WriteFile(target / name, Content(m_nodes[node], chance, random));
}

void ForgetfulDisk::Restore(fs::path const& target, Survivors survivors, Random& random) const
{
    fs::remove_all(target);
    std::vector<bool> const kept = Kept(survivors, random);
    Folders folders = m_flushed;
    for (std::size_t i = 0; i < kept.size(); ++i)
        for (Entry const& entry : m_changes[i].entries)
            if (kept[i] && entry.to != 0)
                folders[entry.folder][entry.name] = entry.to;
            else if (kept[i])
                folders[entry.folder].erase(entry.name);
    constexpr double Likely[] = {0.05, 0.5, 0.95};
    Chance const chance{survivors, random() % 2 == 0 ? 512u : 4096u, Likely[random() % 3]};
    Put(target, folders, 0, chance, random);
}
