// A site that this program has open, as one of any number of programs, from the beginning of a command to its
// end. It is never made here: a name without a site is an error.
#pragma once

#include "standin/server/site/SiteName.h"
#include "standin/server/store/SiteStore.h"
#include "tools/comgui_site/Trouble.h"
#include <memory>

namespace comgui_site
{
// The site of the command line, or else that of this user. Throws WrongUse for a name that has a password in
// it, which others could see in the list of processes; StoreError, as SiteName::Of does.
standin::SiteName NameOfSite(std::string const& given);

// With a name by which it may be replaced: absolute, and of the file behind a link.
std::filesystem::path TargetOf(std::filesystem::path const& file);

// Throws Trouble if a file that is to be written, or what it is a link to, is one of the site's own.
void CheckIsNotOfSite(std::filesystem::path const& file, std::filesystem::path const& site);

class MissingSite : public Trouble
{
public:
    using Trouble::Trouble;
};

class OpenedSite
{
public:
    enum class Others
    {
        Work,  // with the site, as they like
        Wait,  // until the object goes, if they want to open it
    };

    // Throws MissingSite if there is no such site, StoreError if it cannot be opened; a damaged database
    // stays as it is.
    explicit OpenedSite(standin::SiteName name, Others others = Others::Work);
    ~OpenedSite();  // leaves, and reports a failure on stderr
    OpenedSite(OpenedSite const&) = delete;
    OpenedSite& operator=(OpenedSite const&) = delete;

    // For a command that has changed something: it is on the disk when this returns. Throws StoreError.
    void Leave();

    bool IsDatabase() const { return m_name.IsDatabase(); }
    std::filesystem::path const& Folder() const { return m_name.folder; }
    standin::SiteStore& Store() { return *m_store; }

private:
    standin::SiteName const m_name;
    std::unique_ptr<standin::SiteStore> m_store;
};

// " by NAME (process N on MACHINE), ...": the other programs that have it open; empty if there are none.
std::string OtherPrograms(standin::Store& store);

// Throws Trouble if there are any.
void CheckIsAlone(OpenedSite& site);
}  // namespace comgui_site
