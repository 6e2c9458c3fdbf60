// The log that the recorder writes and the model of the disk reads: one record for each call that changed
// something below the recorded folder, in the order in which the calls took effect. A record is its head and
// then, one directly behind the other, the path, the other path and the data.
#pragma once

#include <cstdint>

enum class DiskCall : std::uint32_t
{
    Mark,        // path: the text of the mark
    MakeFile,    // path, file: the inode it got
    MakeFolder,  // path, file
    Write,       // file, offset, data
    Resize,      // file, offset: the new size
    Grow,        // file, offset: the new size, unless it is larger already
    Rename,      // path, other
    Remove,      // path: a file or a folder
    BeginFlush,  // file: fsync or fdatasync of a file or folder begins; offset: a number of its own
    Flush,       // file, offset: that one has ended, and all is on the disk that was written when it began
    Unknown,     // path: a call that changes something in a way that no record describes
};

struct DiskRecordHead
{
    DiskCall call;
    std::uint32_t pathSize;
    std::uint32_t otherSize;
    std::uint32_t reserved12;
    std::uint64_t dataSize;
    std::uint64_t file;
    std::int64_t offset;
};
static_assert(sizeof(DiskRecordHead) == 40);
