// A file while it is being transferred. It has another name until it is whole, in the folder where it will
// lie, so that whoever finds the real name finds the whole file: the old one or the new one. The store has
// note of the other name, so that it goes when the program dies meanwhile.
#pragma once

#include "standin/server/files/Descriptor.h"
#include "standin/server/files/Report.h"
#include "standin/server/store/Store.h"
#include <filesystem>
#include <functional>
#include <string>
#include <string_view>
#include <sys/types.h>

namespace standin
{
bool IsPartFileName(std::string_view name);

// Removes what a program that died has left; nothing if the path is not one of a part file.
void RemovePartFile(std::filesystem::path const& file);

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
    // folder and store stay as long as this lives. A file of that name that is there already gives its
    // permissions; anything else of that name is refused. Throws TransferError and StoreError.
    PartFile(Store& store, int folder, std::string name);
    ~PartFile();
    PartFile(PartFile const&) = delete;
    PartFile& operator=(PartFile const&) = delete;

    // Holes stay holes. after is told after every piece of at most that many bytes how many are done; what it
    // throws passes through. Throws TransferError.
    void CopyFrom(SourceFile const& source, std::size_t piece, std::function<void(off_t done)> const& after);

    // Gives it its name, in the place of a file that had it. Throws TransferError. What has the name after a
    // power cut is the old file or the whole new one; with Survives::PowerCut it is the new one.
    enum class Survives
    {
        EndOfProcess,
        PowerCut,
    };
    void Finish(Survives what);

private:
    void CopyRange(SourceFile const& source, off_t begin, off_t end, std::size_t piece,
                   std::function<void(off_t done)> const& after);
    ssize_t CopyPiece(SourceFile const& source, off_t at, std::size_t size);
    [[noreturn]] void Fail(int reason) const;
    [[noreturn]] void FailAsCut() const;
    std::string Shown() const { return ForMessages(m_name); }

    void MakeFile(mode_t mode);  // of a new file
    void Forget() noexcept;

    Store& m_store;
    int m_folder;
    std::string m_name;
    std::string m_partName;
    std::string m_partPath;        // as the store has it
    bool m_copiesDirectly = true;  // the system copies from file to file, until it turns out that it cannot
    std::string m_buffer;
    Descriptor m_file;
};
}  // namespace standin
