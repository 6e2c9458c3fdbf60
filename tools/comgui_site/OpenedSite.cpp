#include "tools/comgui_site/OpenedSite.h"

#include "standin/server/site/Site.h"
#include "tools/comgui_site/Trouble.h"
#include "tools/comgui_site/words.h"
#include <cstdio>
#include <utility>

namespace comgui_site
{
using standin::SqliteStore;

namespace
{
[[noreturn]] void FailAsMissing(std::filesystem::path const& folder)
{
    throw Trouble(folder.string() +
                  ": no site is there; name the folder of one, or start a program that makes it");
}

std::filesystem::path MustBeThere(std::filesystem::path folder)
{
    std::error_code error;
    auto const status = std::filesystem::status(folder / "site.db", error);
    if (status.type() == std::filesystem::file_type::not_found)
        FailAsMissing(folder);
    if (status.type() == std::filesystem::file_type::none ||
        status.type() == std::filesystem::file_type::unknown)
        throw Trouble((folder / "site.db").string() + ": cannot be opened: " + error.message() +
                      "; run this as the user whom the site belongs to");
    if (!is_regular_file(status))
        throw Trouble((folder / "site.db").string() + ": is no file; move it away, or name another site");
    return folder;
}
}  // namespace

std::filesystem::path FolderOfSite(std::string const& given)
{
    if (given.empty())
        return standin::Site::Folder();
    std::filesystem::path const folder = std::filesystem::absolute(given).lexically_normal();
    return folder.has_filename() ? folder : folder.parent_path();
}

std::filesystem::path TargetOf(std::filesystem::path const& file)
{
    std::error_code error;
    std::filesystem::path const there = std::filesystem::canonical(file, error);
    return error ? std::filesystem::absolute(file).lexically_normal() : there;
}

void CheckIsNotOfSite(std::filesystem::path const& file, std::filesystem::path const& site)
{
    std::filesystem::path const target = TargetOf(file);
    std::string const name = target.filename().string();
    std::error_code error;
    if (std::filesystem::equivalent(target.parent_path(), site, error) &&
        (name.starts_with("site.") || name == "seed.xml"))
        throw Trouble(file.string() + ": is a file of the site itself; choose another name");
}

OpenedSite::OpenedSite(std::filesystem::path folder) : m_folder(MustBeThere(std::move(folder)))
{
    auto const first = [this]() -> standin::StoreContent { FailAsMissing(m_folder); };
    m_store = std::make_unique<SqliteStore>(m_folder, first);
}

OpenedSite::~OpenedSite()
{
    if (!m_store)
        return;
    try
    {
        m_store->Leave();
    }
    catch (std::exception const& error)
    {
        std::fprintf(stderr, "comgui_site: %s\n", Cleaned(error.what()).c_str());
    }
}

void OpenedSite::Leave()
{
    auto const store = std::exchange(m_store, nullptr);
    store->Sync();
    store->Leave();
}
}  // namespace comgui_site
