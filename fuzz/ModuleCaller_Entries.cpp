#include "fuzz/ModuleCaller.h"

#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "comgui/ticket/TICKET_ID.h"
#include "tests/support/Files.h"
#include <memory>
#include <strings.h>

void CALLER::Register()
{
    CLIENT_SESSION& session = NextSession();
    auto const& module = m_site.module;
    STICKET_ACCESS const* request = module->STicketFactory->CreateTicket(nullptr);
    if (m_input.Among(8) != 7)
        request->SSETPARAMETER(request->Instance, "pGUI2Notification", PARAM_POINTER,
                               reinterpret_cast<void const*>(&LISTENER::Call), -1);
    request->SSETPARAMETER(request->Instance, "pUser", PARAM_POINTER, &session.listener, -1);
    char command[] = "local.set.callback";
    int const code = module->SendCommandEntry(module.Instance(), session.handle, command, 0,
                                              const_cast<STICKET_ACCESS*>(request));
    MustBeACode(code);
    int id = -1;
    request->SGETPARAMETER(request->Instance, "iGUINotificationID", PARAM_INT, &id, -1);
    COMGUI_MUST(code != 0 || id > 0);
    if (code == 0)
        session.notification = id;
    module->STicketFactory->DestroyTicket(&request);
    COMGUI_MUST(!request);
}

void CALLER::Switch()
{
    CLIENT_SESSION const& session = NextSession();
    ADDRESS address = NextAddress(m_input);
    if (m_input.Among(4) == 3)
        address = {TICKET_ID_ALL, TICKET_ID_ALL};
    bool const isOn = m_input.Among(4) != 0;
    int const id =
        m_input.Among(8) == 7 ? static_cast<int>(m_input.Among(5)) - 2 : session.notification.load();
    char const* const* const keys = m_keys.NextTable(m_input);
    MTICKET_ACCESS const& access = *session.access;
    int const result = access.MENDISNOTIF(access.Instance, address.type, address.id, id, isOn, keys);
    COMGUI_MUST(result == 0 || result == 1);
    bool const mayBe = id > 0 && (keys || !isOn) && !session.hasEnded;
    COMGUI_MUST(!result || mayBe || !m_clients.isCompared);
}

void CALLER::Command()
{
    static constexpr char const* commands[] = {"remote.system.isalive",
                                               "remote.job.prepare",
                                               "local.set.previewfolder",
                                               "local.set.thumbnailfolder",
                                               "nope",
                                               "",
                                               nullptr};
    char const* const command = commands[m_input.Among(7)];
    std::string const data = m_input.Bytes(m_input.Take<std::uint16_t>() % 600);
    auto const block = std::make_unique<char[]>(data.size());
    std::copy(data.begin(), data.end(), block.get());
    auto const& module = m_site.module;
    int const code = module->SendCommandEntry(module.Instance(), NextSession().handle, command,
                                              static_cast<int>(data.size()), block.get());
    MustBeACode(code);
    COMGUI_MUST(code != 0 || command);
}

void CALLER::PrepareJob()
{
    auto const record = std::make_unique<TCommandRecord>();
    record->nMagic = m_input.Among(8) == 7 ? 0 : 0x49494949;
    record->nSize = m_input.Among(8) == 7 ? 539 : 540;
    record->iArgA = static_cast<int>(m_input.Among(3));
    record->iArgC = m_input.Take<std::int8_t>();
    std::string const text =
        (m_input.Among(8) == 7 ? "$(TEMP)/" : "$(JOB)/") + m_input.Bytes(m_input.Among(20));
    std::fill(std::begin(record->szText2), std::end(record->szText2), m_input.Among(8) == 7 ? 'n' : '\0');
    std::copy(text.begin(), text.end(), record->szText2);
    TCommandRecord const before = *record;
    CLIENT_SESSION const& session = NextSession();
    char command[] = "remote.job.prepare";
    auto const& module = m_site.module;
    int const code =
        module->SendCommandEntry(module.Instance(), session.handle, command, sizeof *record, record.get());
    MustBeACode(code);
    if (code == 101 || code == 103)
        COMGUI_MUST(std::memcmp(&before, record.get(), sizeof before) == 0);
    else
        COMGUI_MUST((record->iResult >= 0) == (code == 0));
    if (code == 0 && m_clients.isCompared)
        COMGUI_MUST(Content({3, record->iResult}).value().contains("Job/State"));
}

std::string CALLER::NextLocalPath()
{
    static constexpr char const* names[] = {"a",    "empty",   "ticket.xml", "folder",
                                            "none", "folder/", "b",          "../site/site.db"};
    unsigned const choice = m_input.Among(10);
    std::string name = choice < 8 ? names[choice] : m_input.Text(m_input.Among(12));
    if (choice >= 8)
        std::replace(name.begin(), name.end(), '.', '-');  // the files of others are not ours to write
    std::string path = m_site.Client(name);
    if (m_input.Among(8) == 7)
        std::replace(path.begin(), path.end(), '/', '\\');
    return path;
}

std::string CALLER::NextServerPath()
{
    static constexpr char const* folders[] = {"$(TEMP)",  "$(TEMP)/",  "$(JOB)/", "$(INSTALL)/",
                                              "$(NOPE)/", "$(TEMP)\\", "/",       "$(TEMP)/../"};
    std::string const folder = folders[m_input.Among(8)];
    return folder + (m_input.Among(2) == 0 ? "a" : m_input.Text(m_input.Among(12)));
}

void CALLER::SendJob()
{
    std::string folder = m_input.Among(8) == 7 ? "$(TEMP)" : "$(UPLOADJOB)";
    TJobIdentification record{};
    record.nSize = m_input.Among(8) == 7 ? 159 : sizeof record;
    record.pszUploadFolder = m_input.Among(8) == 7 ? nullptr : folder.data();
    std::string path = NextLocalPath();
    std::string name = m_input.Among(2) == 0 ? "a" : m_input.Text(m_input.Among(12));
    auto const& module = m_site.module;
    int const code =
        module->SendJobEntry(module.Instance(), NextSession().handle, &record, path.data(), name.data());
    MustBeACode(code);
    if (code != 0 || !m_clients.isCompared || m_clients.carriesFiles)
        return;
    std::replace(path.begin(), path.end(), '\\', '/');
    std::string const content = ContentOf(path);
    bool isThere = false;
    for (int const id : m_site.TicketsOf(3))
    {
        std::string const place = "$(JOB)/" + std::to_string(id) + "/" + name;
        auto const file = ::Read(Content({3, id}).value(), "Job/File", PARAM_STRING, -1);
        isThere = isThere || (file == place && m_site.FileOf(place) == content);
    }
    COMGUI_MUST(isThere);
}

void CALLER::PutFile()
{
    std::string local = NextLocalPath();
    std::string server = NextServerPath();
    auto const& module = m_site.module;
    int const code =
        module->PutFileSyncEntry(module.Instance(), NextSession().handle, local.data(), server.data());
    MustBeACode(code);
    std::replace(local.begin(), local.end(), '\\', '/');
    if (code != 0 || !m_clients.isCompared || m_clients.carriesFiles)
        return;
    std::string const content = ContentOf(local);
    if (server.ends_with(')'))
        server += '/';
    if (server.ends_with('/') || server.ends_with('\\'))
        server += local.substr(local.rfind('/') + 1);
    COMGUI_MUST(m_site.FileOf(server) == content);
}

void CALLER::GetFile()
{
    std::string server = NextServerPath();
    std::string local = NextLocalPath();
    auto const& module = m_site.module;
    MustBeACode(
        module->GetFileSyncEntry(module.Instance(), NextSession().handle, server.data(), local.data()));
}

void CALLER::BeginFile()
{
    std::string local = NextLocalPath();
    std::string server = NextServerPath();
    auto const& module = m_site.module;
    void* const session = NextSession().handle;
    m_clients.carriesFiles = true;
    MustBeACode(m_input.Among(2) == 0
                    ? module->PutFileEntry(module.Instance(), session, local.data(), server.data())
                    : module->GetFileEntry(module.Instance(), session, server.data(), local.data()));
    COMGUI_MUST(module->PutFileEntry(module.Instance(), session, nullptr, server.data()) != 0);
    COMGUI_MUST(module->GetFileSyncEntry(module.Instance(), session, server.data(), nullptr) != 0);
}

void CALLER::CreateLocal()
{
    std::string const path = NextLocalPath();
    auto const* const ticket =
        m_site.module->STicketFactory->CreateTicket(m_input.Among(2) == 0 ? nullptr : path.c_str());
    if (ticket)
        m_locals.push_back(ticket);
}

void CALLER::UseLocal()
{
    if (m_locals.empty())
        return;
    STICKET_ACCESS const& ticket = *m_locals[m_input.Among(static_cast<unsigned>(m_locals.size()))];
    MODEL_TICKET content = Walked(ticket, nullptr);
    char const* const key = m_keys.Next(m_input);
    PARAM_TYPE const type = NextType(m_input);
    int const pos = NextPosition(m_input);
    TEXTS texts;
    auto const slot = [&](void* out) { return ticket.SGETPARAMETER(ticket.Instance, key, type, out, pos); };
    COMGUI_MUST(::Read(slot, type, &texts) == ::Read(content, key, type, pos));
    std::deque<RECORD> records;
    auto table = NextTable(records);
    COMGUI_MUST(ticket.SSETMULTIPAR(ticket.Instance, table.data()) == 1);
    for (std::size_t i = 0; i < records.size(); ++i)
        COMGUI_MUST(table[i].ok == IsDone(content, records[i].key, records[i].value, records[i].pos, false));
    COMGUI_MUST(Walked(ticket, nullptr) == content);
    texts.MustStand();
}

void CALLER::DestroyLocal()
{
    STicketFactory const& factory = *m_site.module->STicketFactory;
    factory.DestroyTicket(nullptr);
    STICKET_ACCESS const* nothing = nullptr;
    factory.DestroyTicket(&nothing);
    STICKET_ACCESS const foreign{};
    STICKET_ACCESS const* ticket = &foreign;
    factory.DestroyTicket(&ticket);
    COMGUI_MUST(ticket == &foreign);
    if (m_locals.empty())
        return;
    factory.DestroyTicket(&m_locals.back());
    COMGUI_MUST(!m_locals.back());
    m_locals.pop_back();
}

void CALLER::DestroyTickets()
{
    for (STICKET_ACCESS const*& ticket : m_locals)
        m_site.module->STicketFactory->DestroyTicket(&ticket);
}

void CALLER::LogIn()
{
    static constexpr char const* words[] = {"admin",     "operator", "secret", "localhost",
                                            "127.0.0.1", "",         "nobody"};
    ::RECORD record(words[m_input.Among(7)], words[m_input.Among(7)], words[m_input.Among(7)],
                    50000 + static_cast<int>(m_input.Among(8) / 7));
    if (m_input.Among(8) == 7)
        std::fill(std::begin(record.szUser), std::end(record.szUser), 'u');
    if (m_input.Among(8) == 7)
        record.nSize = m_input.Take<std::uint16_t>();
    TLogin const before = record;
    auto const& module = m_site.module;
    int const ready = module->InitializeEntry(module.Instance(), &record, 0);
    COMGUI_MUST(ready == (record.nSize == sizeof(TLogin) ? 0 : 101));
    int const code = module->LoginEntry(module.Instance(), &record);
    MustBeACode(code);
    COMGUI_MUST(module->UninitializeEntry(module.Instance(), &record) == (ready == 0 ? 0 : 104));
    if (code == 0)
        COMGUI_MUST(module->LogoutEntry(module.Instance(), record.hSession) == 0);
    else
        COMGUI_MUST(std::memcmp(static_cast<TLogin const*>(&record), &before, sizeof before) == 0);
}

void CALLER::LogOut()
{
    if (m_input.Among(4) != 0)
        return;
    m_passingTexts.MustStand();
    m_passingTexts = {};
    m_clients.LogOut(m_clients.sessions[1]);
}

void CALLER::AskServer()
{
    static constexpr char const* hosts[] = {"localhost", "127.0.0.1", "LocalHost", "", "elsewhere", nullptr};
    char const* const host = hosts[m_input.Among(6)];
    int const port = m_input.Among(2) == 0 ? 50000 : m_input.Take<int>();
    auto const& module = m_site.module;
    int const code = module->IsAliveEntry(module.Instance(), host, port);
    bool const isHere = host && (std::strcmp(host, "127.0.0.1") == 0 || strcasecmp(host, "localhost") == 0);
    COMGUI_MUST(code == (!host ? 101 : isHere && port == 50000 ? 0 : 105));
    COMGUI_MUST(module->GetLocalAddressEntry(module.Instance(), host, port) == 0x7F000001);
}

void CALLER::WrongHandles()
{
    auto const& module = m_site.module;
    auto const number = m_input.Take<std::uint32_t>() | 0x80000000u;  // far above those given out
    auto* const handle = reinterpret_cast<void*>(std::uintptr_t{number} << m_input.Among(33));
    int size = 0;
    char text[] = "a";
    for (void* const instance : {module.Instance(), handle})
    {
        int const code = instance == handle ? 102 : 103;
        COMGUI_MUST(module->LogoutEntry(instance, handle) == code);
        COMGUI_MUST(!module->GetClientContainerEntry(instance, handle));
        COMGUI_MUST(module->GetTicketDataEntry(instance, handle, 0, 0, 0, &size, nullptr) == code);
        COMGUI_MUST(module->SendCommandEntry(instance, handle, text, 0, nullptr) == code);
        COMGUI_MUST(module->PutFileEntry(instance, handle, text, text) == code);
        COMGUI_MUST(module->SendJobEntry(instance, handle, nullptr, nullptr, nullptr) == code);
    }
    COMGUI_MUST(module->LoginEntry(handle, nullptr) == 102 && module->Open(nullptr) == 101);
    COMGUI_MUST(module->LoginEntry(module.Instance(), nullptr) == 101);
}
