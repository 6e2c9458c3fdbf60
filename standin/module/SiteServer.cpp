#include "standin/module/SiteServer.h"

#include "standin/module/HostCalls.h"
#include "standin/server/files/FileError.h"
#include "standin/server/files/ForkedChild.h"
#include "standin/server/files/Report.h"
#include <dlfcn.h>
#include <map>
#include <unistd.h>

namespace standin
{
namespace
{
constexpr std::chrono::seconds PatienceAtTheEnd(1);

// The seed that the bundle brings, found from where the bundle's executable lies.
std::filesystem::path ShippedSeed()
{
    Dl_info module{};
    if (!dladdr(reinterpret_cast<void const*>(&ShippedSeed), &module))
        return {};
    auto const executable = std::filesystem::absolute(module.dli_fname);
    return executable.parent_path().parent_path() / "Resources" / "seed.xml";
}

using Sites = std::map<SiteName, std::unique_ptr<OpenSite>>;

// At the end of the process the clients' callbacks go before this module does; no thread of ours may call
// them then. A callback that hangs holds up the end for a moment only. Transfers are cut, so that they take
// their beginnings of files away. The site is left in order, for the programs that stay and the next to come.
struct EndOfWork
{
    Sites const& sites;
    pid_t const process = getpid();

    ~EndOfWork()
    {
        if (IsForkedChild() || getpid() != process)  // a child of a raw clone is told nothing
            return;
        for (auto const& [name, open] : sites)
        {
            open->server.Stop(PatienceAtTheEnd);
            open->site.Leave();
        }
    }
};

OpenSite& Opened(SiteName const& name)
{
    // Never destroyed: containers may be used while the process comes to its end.
    static auto& lock = *new std::mutex;
    static auto& sites = *new Sites;
    static EndOfWork const atExit{sites};
    std::lock_guard const guard(lock);
    auto const known = sites.find(name);
    if (known != sites.end())
        return *known->second;
    return *sites.emplace(name, std::make_unique<OpenSite>(name)).first->second;
}
}  // namespace

OpenSite::OpenSite(SiteName const& name) : site(name, ShippedSeed()), server(site.store(), site.folder())
{
    site.PutInOrder(server);
}

OpenSite* SiteOfThisProcess() noexcept
{
    try
    {
        return &Opened(SiteName::OfThisUser());
    }
    catch (StoreError const& error)
    {
        Report(error.what());
    }
    catch (FileError const& error)
    {
        Report(error.what());
    }
    catch (std::exception const& error)
    {
        TellOfFailure(error.what());
    }
    return nullptr;
}
}  // namespace standin
