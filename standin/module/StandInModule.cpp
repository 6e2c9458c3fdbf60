#include "standin/module/StandInModule.h"

#include "comgui/ticket/STICKET_ACCESS.h"
#include "standin/module/LocalTicket.h"
#include "standin/module/ModuleCodes.h"
#include "standin/module/ModuleSession.h"
#include "standin/module/SiteServer.h"
#include "standin/server/files/FileError.h"
#include "standin/server/files/Report.h"
#include <strings.h>
#include <unistd.h>

namespace standin
{
namespace
{
using comgui::plugin::Credentials;
using comgui::plugin::LoggedIn;
using comgui::plugin::Refused;
using comgui::plugin::TicketSlots;

bool IsThisHost(std::string const& host)
{
    char own[256] = "";
    gethostname(own, sizeof own - 1);
    return strcasecmp(host.c_str(), "localhost") == 0 || host == "127.0.0.1" ||
           (*own && strcasecmp(host.c_str(), own) == 0);
}

constexpr char PortKey[] = "System/MasterSOAPPort";
constexpr int PortOfANewSite = 50000;

// Whoever deletes the port, or writes what is none, locks nobody out.
int PortOf(OpenSite& site)
{
    int const port = site.server.Tickets().Int(SystemTicket, PortKey).value_or(PortOfANewSite);
    return port >= 1 && port <= 65535 ? port : PortOfANewSite;
}

// The site behind host and port; throws the code that says why there is none.
OpenSite& SiteAt(std::string const& host, int port)
{
    if (!IsThisHost(host))
        throw Refused(MODULE_NO_SERVER_THERE);
    OpenSite* const site = SiteOfThisProcess();
    if (!site)
        throw Refused(MODULE_SITE_UNAVAILABLE);
    if (PortOf(*site) != port)
        throw Refused(MODULE_NO_SERVER_THERE);
    return *site;
}

int GetReason(STICKET_ACCESS const* ticket)
{
    if (!ticket)
        return MODULE_INVALID_ARGUMENT;
    std::string const reason = RefusableCall::TakeReason();
    bool const isThere = !reason.empty();
    bool const isTaken =
        ticket->SSETPARAMETER(ticket->Instance, "Reason/Text", isThere ? PARAM_STRING : PARAM_NONE,
                              isThere ? reason.c_str() : nullptr, -1);
    return isTaken ? MODULE_DONE : MODULE_INVALID_ARGUMENT;
}
}  // namespace

int StandInModule::IsAlive(std::string_view host, int port)
{
    Server& server = SiteAt(std::string(host), port).server;
    Pass(server.Tickets(), server.Troubles(), {.call = "IsAliveEntry"});
    return server.IsReachable() ? MODULE_DONE : MODULE_SITE_UNAVAILABLE;
}

int StandInModule::Initialize(TLogin&)
{
    OpenSite* const site = SiteOfThisProcess();
    if (!site)
        return MODULE_SITE_UNAVAILABLE;
    Pass(site->server.Tickets(), site->server.Troubles(), {.call = "InitializeEntry"});
    return MODULE_DONE;
}

LoggedIn StandInModule::LogIn(Credentials const& credentials)
{
    OpenSite& site = SiteAt(credentials.host, credentials.port);
    Pass(site.server.Tickets(), site.server.Troubles(), {.call = "LoginEntry", .user = credentials.user});
    try
    {
        auto session = site.server.Login(credentials.user, credentials.password);
        if (!session)
            throw Refused(MODULE_LOGIN_REFUSED);
        User const& user = session->Who();
        std::string const endPoint = "127.0.0.1:" + std::to_string(credentials.localPort);
        session->SetEndPoint(endPoint);
        return {std::make_unique<ModuleSession>(site.server, session), user.ticketId, user.role, endPoint};
    }
    catch (StoreError const& error)
    {
        Report(error.what());
        throw Refused(MODULE_SITE_UNAVAILABLE);
    }
}

std::unique_ptr<TicketSlots> StandInModule::MakeTicket() { return std::make_unique<LocalTicket>(); }

std::unique_ptr<TicketSlots> StandInModule::OpenTicket(std::string_view path)
{
    try
    {
        auto file = LocalTicket::FileToOpen(std::string(path));
        return file ? std::make_unique<LocalTicket>(std::move(*file)) : nullptr;
    }
    catch (XmlError const& error)
    {
        Report(std::string(error.what()) + "; correct the file, or put a sound copy in its place");
    }
    catch (FileError const& error)
    {
        Report(error.what());
    }
    return nullptr;
}

bool StandInModule::CloseTicket(TicketSlots& ticket)
{
    try
    {
        static_cast<LocalTicket&>(ticket).Save();
        return true;
    }
    catch (FileError const& error)
    {
        Report(error.what());
        return false;
    }
}

int StandInModule::Command(comgui::plugin::Session* session, char const* name, int size, void* data)
{
    if (name && std::string_view(name) == "local.get.reason")
        return GetReason(static_cast<STICKET_ACCESS const*>(data));
    return Module::Command(session, name, size, data);
}
}  // namespace standin
