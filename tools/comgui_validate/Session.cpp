#include "tools/comgui_validate/Session.h"

#include "comgui/foundation/stracpy.h"
#include "comgui/ticket/TICKET_ID.h"
#include <charconv>
#include <cstdlib>
#include <new>
#include <numeric>
#include <vector>

namespace validate
{
namespace
{
constexpr int Stamp = 20'261'123;  // the plug-in only carries it

template <std::size_t Size>
void Assign(char (&field)[Size], std::string const& text)
{
    stracpy(field, text.c_str(), Size);
}
}  // namespace

void Record::FREE::operator()(TLogin* record) const { std::free(record); }

Record::Record(Trial& trial) : m_trial(trial), m_record(static_cast<TLogin*>(std::calloc(1, sizeof(TLogin))))
{
    if (!m_record)
        throw std::bad_alloc();
    Options const& options = trial.GetOptions();
    if (!options.user)
        throw Skipped("no user; name one with --user and --password");
    m_module = &trial.GetModule();
    m_record->nSize = sizeof(TLogin);
    m_record->iGUINotificationID = -1;
    m_record->iLocalPort = 50106;
    Assign(m_record->szUser, *options.user);
    Assign(m_record->szPassword, options.password);
    Assign(m_record->szServerHost, options.host);
    m_record->iServerPort = options.port;
}

int Record::Initialize()
{
    m_record->iClientStamp = Stamp;
    m_trial.Calling("InitializeEntry(instance, record, stamp)");
    return m_module->table.InitializeEntry(m_module->instance, m_record.get(), Stamp);
}

int Record::LogIn()
{
    m_trial.Calling("LoginEntry(instance, record) for the user " + Quoted(m_record->szUser));
    return m_module->Live().LoginEntry(m_module->instance, m_record.get());
}

int Record::LogOut()
{
    m_trial.Calling("LogoutEntry(instance, session)");
    return m_module->table.LogoutEntry(m_module->instance, m_record->hSession);
}

Session::Session(Trial& trial) : m_trial(trial), m_record(trial)
{
    if (m_record.Initialize() != 0 || m_record.LogIn() != 0)
        throw Skipped("the login is refused; see the checks session.*");
    m_isIn = true;
}

Session::~Session()
{
    if (m_isIn)
        LogOut();
}

int Session::LogOut()
{
    m_isIn = false;
    return m_record.LogOut();
}

MTICKET_ACCESS const* Session::Container()
{
    Module& module = m_trial.GetModule();
    if (!m_container)
    {
        m_trial.Calling("GetClientContainerEntry(instance, session)");
        m_container = module.Live().GetClientContainerEntry(module.instance, Handle());
    }
    if (!m_container)
        throw Skipped("the session has no container; see container.there");
    return m_container;
}

int Session::Send(char const* command, int size, void* data)
{
    Module& module = m_trial.GetModule();
    std::string text = command;
    m_trial.Calling("SendCommandEntry(instance, session, " + Quoted(text) + ", " + std::to_string(size) +
                    ", data)");
    return module.table.SendCommandEntry(module.instance, Handle(), text.data(), size, data);
}

std::vector<int> TypesToTry(Trial const& trial)
{
    if (trial.HasOption("ticket-type"))
        return {NumberOf(trial.Option("ticket-type", "")).value_or(-1)};
    std::vector<int> types{12, 2, 7, 3};  // papers, devices, queues and jobs of the servers we know
    types.resize(types.size() + 99);
    std::iota(types.begin() + 4, types.end(), 1);
    return types;
}

ScratchTicket::ScratchTicket(Session& session) : m_container(session.Container())
{
    Trial& trial = session.GetTrial();
    trial.Calling("MOPERATION(type, TICKET_ID_NEXT, MTICKET_OP_CREATE_NEXT, &id)");
    if (!trial.HasOption("ticket"))
        for (int const type : TypesToTry(trial))
            if (int id = -1; m_container->MOPERATION(m_container->Instance, type, TICKET_ID_NEXT,
                                                     MTICKET_OP_CREATE_NEXT, &id) != 0 &&
                             id >= 0)
            {
                m_type = type;
                m_id = id;
                m_isOwn = true;
                return;
            }
    std::string const named = trial.Option("ticket", "");
    auto const slash = named.find('/');
    auto const type = NumberOf(named.substr(0, slash));
    auto const id = slash == std::string::npos ? std::nullopt : NumberOf(named.substr(slash + 1));
    if (!type || !id)
        throw Skipped("no ticket can be made; name one to write to with --option ticket=TYPE/ID");
    m_type = *type;
    m_id = *id;
}

ScratchTicket::~ScratchTicket()
{
    if (!m_isOwn)
        return;
    m_container->MOPERATION(m_container->Instance, m_type, m_id, MTICKET_OP_DELETE, nullptr);
}

std::string NameOf(int type, int id) { return std::to_string(type) + ", " + std::to_string(id); }
}  // namespace validate
