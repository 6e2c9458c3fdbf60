#include "tools/comgui_site/copy.h"

#include "standin/server/files/AtomicFile.h"
#include "standin/server/files/SiteFiles.h"
#include "standin/server/transfer/PartFile.h"
#include "tools/comgui_site/NewDatabase.h"
#include "tools/comgui_site/OpenedSite.h"
#include "tools/comgui_site/Progress.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/Workplace.h"
#include "tools/comgui_site/content.h"
#include <algorithm>
#include <fstream>

namespace comgui_site
{
namespace
{
using std::filesystem::path;

// The database is copied in another way; site.lock, site.number and the rest belong to the place.
bool IsOfPlace(std::filesystem::directory_entry const& entry, int depth)
{
    std::string const name = entry.path().filename().string();
    return (depth == 0 && (name.starts_with("site.") || name == "lost+found")) ||
           standin::IsPartFileName(name);
}

void CheckIsEmpty(path const& folder)
{
    std::error_code error;
    for (auto const& entry : std::filesystem::directory_iterator(folder, error))
        if (entry.path().filename() != "lost+found" &&
            !standin::IsTemporary(entry.path().filename().string(), ".copy"))
            throw Trouble(folder.string() + ": is not empty: there is " + entry.path().filename().string() +
                          " in it; name a folder of the copy's own");
}

// It would be copied into itself.
void CheckIsOutside(path const& folder, path const& site)
{
    path const place = std::filesystem::weakly_canonical(folder);
    path const around = std::filesystem::weakly_canonical(site);
    if (std::mismatch(around.begin(), around.end(), place.begin(), place.end()).first == around.end())
        throw Trouble(folder.string() + ": is in the folder of the first site; name one outside of it");
}

bool HasSameBytes(path const& left, path const& right)
{
    constexpr std::size_t Block = 1 << 16;
    std::ifstream one(left, std::ios::binary);
    std::ifstream other(right, std::ios::binary);
    std::string first(Block, '\0');
    std::string second(Block, '\0');
    while (one && other)
    {
        one.read(first.data(), Block);
        other.read(second.data(), Block);
        if (one.gcount() != other.gcount() || first.compare(0, static_cast<std::size_t>(one.gcount()), second,
                                                            0, static_cast<std::size_t>(one.gcount())) != 0)
            return false;
    }
    return one.eof() && other.eof();
}

class Files
{
public:
    Files(path from, path to, Copied& copied) : m_from(std::move(from)), m_to(std::move(to)), m_copied(copied)
    {
    }

    void Copy()
    {
        Progress progress("copying files");
        ForEach(
            [&](std::filesystem::directory_entry const& entry, path const& target)
            {
                progress(m_copied.files, 0);
                CopyOne(entry, target);
            });
    }

    void Compare() const
    {
        Progress progress("comparing files");
        ForEach(
            [&](std::filesystem::directory_entry const& entry, path const& target)
            {
                progress(0, 0);
                if (entry.is_regular_file() && !entry.is_symlink() && !HasSameBytes(entry.path(), target))
                    throw Trouble(entry.path().string() +
                                  ": has changed while it was copied; end what writes to it, then try again");
            });
    }

    // To where they will be, once all of them are there; and back, if the site does not come to be.
    void MoveTo(path const& folder)
    {
        for (auto const& entry : std::filesystem::directory_iterator(m_to))
        {
            std::filesystem::rename(entry.path(), folder / entry.path().filename());
            m_moved.push_back(entry.path().filename());
        }
        standin::FlushFolder(folder);
    }
    void MoveBackFrom(path const& folder) noexcept
    {
        std::error_code ignored;
        for (path const& name : m_moved)
            std::filesystem::rename(folder / name, m_to / name, ignored);
    }

private:
    template <typename Action>
    void ForEach(Action const& action) const
    {
        for (std::filesystem::recursive_directory_iterator entry(m_from);
             entry != std::filesystem::recursive_directory_iterator(); ++entry)
        {
            if (!IsOfPlace(*entry, entry.depth()))
                action(*entry, m_to / entry->path().lexically_relative(m_from));
            else if (entry->is_directory())
                entry.disable_recursion_pending();
        }
    }

    void CopyOne(std::filesystem::directory_entry const& entry, path const& target)
    {
        if (entry.is_symlink())
            std::filesystem::copy_symlink(entry.path(), target);
        else if (entry.is_directory())
        {
            std::filesystem::create_directory(target, entry.path());
            standin::FlushFolder(target.parent_path());
        }
        else if (entry.is_regular_file())
        {
            std::filesystem::copy_file(entry.path(), target);
            standin::FlushFile(target);
            standin::FlushFolder(target.parent_path());
            ++m_copied.files;
            m_copied.bytes += entry.file_size();
        }
    }

    path const m_from;
    path const m_to;
    Copied& m_copied;
    std::vector<path> m_moved;
};

void Compare(OpenedSite& source, NewDatabase& target)
{
    auto const differences = DifferencesBetween(source.Store(), target.Store());
    if (!differences.empty())
        throw Trouble("the copy differs: " + differences[0] + "; check the first site, then try again");
}

standin::Sequence NewestChange(OpenedSite& site)
{
    return site.Store().Tickets([](auto const&, auto const&) {});
}

// A connection that broke meanwhile has let others in, and who was thought dead may have come back.
void CheckWasHeld(OpenedSite& source, standin::Sequence newest)
{
    if (!source.Store().KeepsOpening())
        throw Trouble(source.Store().Name() +
                      ": the connection broke, so that others could open the site while "
                      "it was copied; see that nobody does, then try again");
    CheckIsAlone(source);
    if (NewestChange(source) != newest)
        throw Trouble(source.Store().Name() +
                      ": was changed while it was copied; end what writes to it, then try again");
}
}  // namespace

Copied CopySite(standin::SiteName const& from, standin::SiteName const& to)
try
{
    OpenedSite source(from, OpenedSite::Others::Wait);
    CheckIsAlone(source);
    standin::Sequence const newest = NewestChange(source);
    CheckIsEmpty(to.folder);
    CheckIsOutside(to.folder, from.folder);
    standin::MakePrivateFolders({to.folder});
    Workplace const workplace(to.folder / ".copy");
    path const database = workplace.Folder() / "database";
    path const place = workplace.Folder() / "files";
    standin::MakePrivateFolders({database, place});
    auto const target = NewDatabase::Begin(to, database);
    Copied copied;
    Files files(from.folder, place, copied);
    CopyContent(source.Store(), target->Store());
    files.Copy();
    Compare(source, *target);
    files.Compare();
    target->Store().Tickets([&](auto const&, auto const&) { ++copied.tickets; });
    copied.users = target->Store().Users().size();
    CheckWasHeld(source, newest);
    try
    {
        files.MoveTo(to.folder);
        target->Finish();
    }
    catch (UnknownEnd const& unknown)
    {
        throw Trouble(std::string(unknown.what()) + "; the files are in " + to.folder.string());
    }
    catch (...)
    {
        files.MoveBackFrom(to.folder);
        throw;
    }
    source.Leave();
    return copied;
}
catch (std::filesystem::filesystem_error const& error)
{
    throw standin::FileError(standin::FileFault(error.path1(), "cannot be copied", error.code().value()));
}
}  // namespace comgui_site
