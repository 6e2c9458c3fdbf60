// A file while it is being transferred. It has another name until it is whole, in the folder where it will
// lie, so that whoever finds the real name finds the whole file: the old one or the new one. A process that
// is killed leaves the other name behind, and RemovePartFiles takes it away.
#pragma once

#include "standin/server/files/Descriptor.h"
#include <filesystem>
#include <functional>
#include <string>
#include <string_view>
#include <sys/types.h>

namespace standin
{
// A text with its control characters replaced, for a message of one line.
std::string ForMessages(std::string_view text);

bool IsPartFileName(std::string_view name);

// Removes the part files in a folder. Those of a process that lives are left alone, unless all is set:
// whoever has the site knows that no other process works in its folders.
void RemovePartFiles(std::filesystem::path const& folder, bool all);

// A regular file that is read. Throws TransferError.
class SourceFile
{
public:
    // In a folder; a symbolic link is refused.
    SourceFile(int folder, std::string const& name);
    explicit SourceFile(std::filesystem::path const& file);  // links are followed

    int Number() const { return m_file.Number(); }
    off_t Size() const { return m_size; }  // at the beginning

private:
    void Check(std::string const& shown, int reason);

    Descriptor m_file;
    off_t m_size = 0;
};

class PartFile
{
public:
    // folder stays open as long as this lives. A file of that name that is there already gives its
    // permissions; anything else of that name is refused. Throws TransferError.
    PartFile(int folder, std::string name);
    ~PartFile();
    PartFile(PartFile const&) = delete;
    PartFile& operator=(PartFile const&) = delete;

    // Holes stay holes. after is told after every piece of at most that many bytes how many are done; what it
    // throws passes through. Throws TransferError.
    void CopyFrom(SourceFile const& source, std::size_t piece, std::function<void(off_t done)> const& after);

    // Gives it its name, in the place of a file that had it. Throws TransferError.
    void Finish();

private:
    void CopyRange(SourceFile const& source, off_t begin, off_t end, std::size_t piece,
                   std::function<void(off_t done)> const& after);
    ssize_t CopyPiece(SourceFile const& source, off_t at, std::size_t size);
    [[noreturn]] void Fail(int reason) const;
    [[noreturn]] void FailAsCut() const;
    std::string Shown() const { return ForMessages(m_name); }

    int m_folder;
    std::string m_name;
    std::string m_partName;
    bool m_copiesDirectly = true;  // the system copies from file to file, until it turns out that it cannot
    std::string m_buffer;
    Descriptor m_file;
};
}  // namespace standin
