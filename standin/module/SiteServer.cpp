#include "standin/module/SiteServer.h"

#include "standin/module/Guard.h"
#include "standin/server/site/Site.h"
#include "standin/server/transfer/TransferService.h"
#include <dlfcn.h>
#include <filesystem>
#include <map>

namespace standin
{
namespace
{
struct OpenSite
{
    explicit OpenSite(std::filesystem::path const& folder);

    Site site;
    TicketServer server;
};

// The seed that the bundle brings, found from where the bundle's executable lies.
std::filesystem::path ShippedSeed()
{
    Dl_info module{};
    if (!dladdr(reinterpret_cast<void const*>(&ShippedSeed), &module))
        return {};
    auto const executable = std::filesystem::absolute(module.dli_fname);
    return executable.parent_path().parent_path() / "Resources" / "seed.xml";
}

OpenSite::OpenSite(std::filesystem::path const& folder)
    : site(Site::Open(folder, ShippedSeed())), server(site.storage(), [this] { site.MirrorSystemTicket(); })
{
    server.Transfers().KeepOut(site.folder());
}

using Sites = std::map<std::filesystem::path, std::unique_ptr<OpenSite>>;

// At the end of the process the clients' callbacks go before this module does; no thread of ours may call
// them then. A callback that hangs holds up the end for a moment only. Transfers are cut, so that they take
// their beginnings of files away.
struct EndOfWork
{
    Sites const& sites;

    ~EndOfWork()
    {
        for (auto const& [folder, site] : sites)
        {
            site->server.Transfers().Stop(std::chrono::seconds(1));
            site->server.Notifications().Stop(std::chrono::seconds(1));
        }
    }
};

TicketServer& ServerOf(std::filesystem::path const& folder)
{
    // Never destroyed: containers may be used while the process comes to its end.
    static auto& lock = *new std::mutex;
    static auto& sites = *new Sites;
    static EndOfWork const atExit{sites};
    std::lock_guard const guard(lock);
    auto const known = sites.find(folder);
    if (known != sites.end())
        return known->second->server;
    return sites.emplace(folder, std::make_unique<OpenSite>(folder)).first->second->server;
}
}  // namespace

TicketServer* ServerOfThisSite() noexcept
{
    return Guarded<TicketServer*>(nullptr,
                                  []() -> TicketServer*
                                  {
                                      try
                                      {
                                          return &ServerOf(Site::Folder());
                                      }
                                      catch (StorageError const& error)
                                      {
                                          std::fprintf(stderr, "%s\n", error.what());
                                          return nullptr;
                                      }
                                  });
}
}  // namespace standin
