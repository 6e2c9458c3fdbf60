// The database of a site that is made anew and gets its name only when it is whole.
#pragma once

#include "standin/server/site/SiteName.h"
#include "standin/server/store/SiteStore.h"
#include "tools/comgui_site/Trouble.h"
#include <memory>

namespace comgui_site
{
// Whether the new one has its name nobody knows, so that its files must stay.
class UnknownEnd : public Trouble
{
public:
    using Trouble::Trouble;
};

class NewDatabase
{
public:
    // What becomes of a site that is there already.
    enum class Old
    {
        Forbidden,  // it is an error
        SetAside,   // it gets another name. Of a database only; see restore for a folder
    };

    // workplace: an empty folder on the disk of the site's own, to work in. Throws Trouble or StoreError.
    static std::unique_ptr<NewDatabase>
    Begin(standin::SiteName const& name, std::filesystem::path const& workplace, Old old = Old::Forbidden);

    virtual ~NewDatabase() = default;  // nothing of it is left unless it was finished
    NewDatabase(NewDatabase const&) = delete;
    NewDatabase& operator=(NewDatabase const&) = delete;

    // Without tickets and users at first.
    virtual standin::SiteStore& Store() = 0;

    // Ends the work on it; it is on the disk and has its name when this returns. The result: what the one
    // before is called now; empty if there was none. Throws StoreError or Trouble; UnknownEnd if a server was
    // lost over it for good.
    virtual std::string Finish() = 0;

protected:
    NewDatabase() = default;
};
}  // namespace comgui_site
