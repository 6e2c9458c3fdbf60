// A disk that forgets: what a power cut may leave of a folder, found by replaying a recorded log up to the
// moment of the cut.
//
// What is certain. The content of a file as of its last fsync or fdatasync. Of a folder, the entries as of
// its last fsync. The two are separate: a file that was flushed in a folder that was not may have no name,
// and a name that was flushed may lead to an empty file. A rename is one step, never half done. A 512-byte
// sector is old or new, and bytes beside those that are written do not change.
//
// What is left to chance is everything later, and Survivors names the ways in which that goes:
//   Nothing     the strictest disk that POSIX allows: what was not flushed is not there
//   NamesAlone  all names, and of the files what was flushed: what a journal of names alone leaves behind, as
//               ext4 with data=writeback, or with delayed allocation and no care for renames
//   InOrder     names as a journal commits them, all up to some moment and none after it, over all folders.
//               Of each file the unflushed writes up to some moment of its own, the last of them in part.
//               ext4 with ordered data leaves such states, and this leaves worse: there a size grows only
//               once the bytes are there
//   AnySubset   each change of a name and each piece of an unflushed write for itself, but no change of an
//               entry without the earlier ones of the same entry. More than any journalling file system
//               leaves; nothing that POSIX forbids
//   Everything  all was on the disk already, as when the program is killed and the power stays
//
// Left out: a disk that lies about a flush, and decay of what had been written long before. Times, owners and
// permissions are not kept. What was in the folder at the beginning counts as flushed.
//
// For one thread at a time. Every failure throws.
#pragma once

#include "tests/powercut/DiskRecord.h"
#include <array>
#include <filesystem>
#include <map>
#include <random>
#include <set>
#include <string>
#include <string_view>
#include <vector>

struct DiskRecord
{
    DiskRecordHead head{};
    std::string path;
    std::string other;
    std::string data;
};

std::vector<DiskRecord> ReadDiskLog(std::filesystem::path const& file);

enum class Survivors
{
    Nothing,
    NamesAlone,
    InOrder,
    AnySubset,
    Everything,
};
inline constexpr std::array AllSurvivors{Survivors::Nothing, Survivors::NamesAlone, Survivors::InOrder,
                                         Survivors::AnySubset, Survivors::Everything};
char const* NameOf(Survivors survivors);

class ForgetfulDisk
{
public:
    // Takes in what is in the folder now. No links.
    explicit ForgetfulDisk(std::filesystem::path const& folder);

    void Replay(DiskRecord const& record);

    using Random = std::mt19937_64;

    // Makes the target folder anew, as the disk is after a power cut now.
    void Restore(std::filesystem::path const& target, Survivors survivors, Random& random) const;

    // Every content that has had that name, relative to the folder, at the end of a call that gave it to a
    // file: for a file that is only ever replaced as a whole, those that may be found.
    std::set<std::string> const& ContentsOf(std::string const& name) const;

private:
    using Node = std::size_t;  // the place in m_nodes; 0 is the folder itself, and no entry leads there
    using Entries = std::map<std::string, Node>;

    struct Write  // of bytes, or a resize if there are none
    {
        std::size_t offset = 0;
        std::string data;
    };

    struct File
    {
        bool isFolder = false;
        std::string flushed;
        std::string current;
        std::vector<Write> pending;  // behind those that are flushed
        std::size_t flushedWrites = 0;
        Entries entries;  // current
    };

    struct Entry
    {
        Node folder;
        std::string name;
        Node to;  // 0: removed
    };

    struct NameChange  // one step
    {
        Node subject;
        std::vector<Entry> entries;
        bool isFlushed = false;
    };

    struct RunningFlush
    {
        Node node = 0;
        std::string content;    // of a file
        std::size_t taken = 0;  // writes to the file, or changes of names
    };

    using Folders = std::map<Node, Entries>;
    struct Chance;

    void TakeIn(std::filesystem::path const& folder, Node node);
    Node Add(bool isFolder, std::uint64_t inode);
    Node Find(std::uint64_t inode) const;
    Entry Resolve(std::string const& path) const;
    void Change(Node subject, std::vector<Entry> entries);
    void Apply(Node node, Write write);
    void BeginFlush(Node node, std::int64_t number);
    void EndFlush(std::int64_t number);
    void FlushFile(RunningFlush const& flush);
    void FlushFolder(RunningFlush const& flush);
    void NoteContents(std::string const& path, Node node);

    std::vector<bool> Kept(Survivors survivors, Random& random) const;
    std::string Content(File const& file, Chance const& chance, Random& random) const;
    void Put(std::filesystem::path const& target, Folders const& folders, Node folder, Chance const& chance,
             Random& random) const;

    std::string const m_root;
    std::vector<File> m_nodes;
    std::map<std::uint64_t, Node> m_byInode;  // the newest with that number
    Folders m_flushed;                        // as at the beginning
    std::vector<NameChange> m_changes;        // since then, in order
    std::map<std::int64_t, RunningFlush> m_flushes;
    std::map<std::string, std::set<std::string>> m_contents;
};
