#include "tests/session/FakeModule.h"

#include "comgui/host/UtilityObjects.h"
#include "comgui/session/ComGUIGlobals.h"
#include <CoreFoundation/CoreFoundation.h>
#include <cstdio>
#include <cstdlib>
#include <cstring>

namespace
{
FakeModule* current = nullptr;

std::string HexOf(void const* bytes, std::size_t size)
{
    std::string hex;
    for (std::size_t i = 0; i < size; ++i)
    {
        char digits[3];
        std::snprintf(digits, sizeof digits, "%02X", static_cast<unsigned char const*>(bytes)[i]);
        hex += digits;
    }
    return hex;
}
}  // namespace

extern "C" COMGUI_EXPORT void* MakeFakeInstance(char const* factory, CFUUIDRef type)
{
    CFUUIDBytes const bytes = CFUUIDGetUUIDBytes(type);
    current->typeUUID = HexOf(&bytes, sizeof bytes);
    current->factories.emplace_back(factory);
    return current->Instance();
}

struct FAKE_ENTRIES
{
    static int QueryInterface(void* instance, COMGUI_UUID id, void** out)
    {
        EXPECT_EQ(instance, &current->m_instance);
        current->instanceCalls.emplace_back("QueryInterface");
        current->interfaceUUID = HexOf(id.bytes, sizeof id.bytes);
        if (current->givesInterface)
            *out = &current->m_interface;
        return 0;
    }

    static unsigned int Release(void* instance)
    {
        EXPECT_EQ(instance, &current->m_instance);
        current->instanceCalls.emplace_back("Release");
        return 0;
    }

    static int Open(void** handle)
    {
        if (current->setsHandle)
            *handle = current->Handle();
        return current->Answer("Open");
    }

    static int WithRecord(char const* entry, void* handle, TLogin* login)
    {
        current->login = login;
        current->copy = *login;
        return current->Called(entry, handle);
    }

    static int WithSession(char const* entry, void* handle, void* session)
    {
        current->session = session;
        return current->Called(entry, handle);
    }

    static int Initialize(void* handle, TLogin* login, int stamp)
    {
        current->stamp = stamp;
        return WithRecord("InitializeEntry", handle, login);
    }

    static int IsAlive(void* handle, char const* host, int port)
    {
        current->host = host;
        current->port = port;
        return current->Called("IsAliveEntry", handle);
    }

    static unsigned int GetLocalAddress(void* handle, char const* host, int port)
    {
        EXPECT_EQ(current->host, host);
        EXPECT_EQ(current->port, port);
        current->Called("GetLocalAddressEntry", handle);
        return current->localAddress;
    }

    static int Login(void* handle, TLogin* login)
    {
        int const result = WithRecord("LoginEntry", handle, login);
        if (current->onLogin)
            current->onLogin(*login);
        return result;
    }

    static int Logout(void* handle, void* session)
    {
        if (current->onLogout)
            current->onLogout();
        return WithSession("LogoutEntry", handle, session);
    }

    static int Uninitialize(void* handle, TLogin* login)
    {
        return WithRecord("UninitializeEntry", handle, login);
    }

    static int UninitializeAsync(void* handle, TLogin* login)
    {
        return WithRecord("UninitializeAsyncEntry", handle, login);
    }

    static MTICKET_ACCESS const* GetClientContainer(void* handle, void* session)
    {
        WithSession("GetClientContainerEntry", handle, session);
        return current->container;
    }

    static int GetTicketData(void* handle, void* session, int a, int b, int c, int* size, void* data)
    {
        current->ints = {a, b, c};
        current->pointers = {size, data};
        return WithSession("GetTicketDataEntry", handle, session);
    }

    static int SendCommand(void* handle, void* session, char const* command, int size, void* data)
    {
        int const result = WithSession("SendCommandEntry", handle, session);
        return current->onCommand ? current->onCommand(command, size, data) : result;
    }

    static int File(char const* entry, void* handle, void* session, char* first, char* second)
    {
        current->pointers = {first, second};
        return WithSession(entry, handle, session);
    }

    static int PutFile(void* handle, void* session, char* first, char* second)
    {
        return File("PutFileEntry", handle, session, first, second);
    }

    static int PutFileSync(void* handle, void* session, char* first, char* second)
    {
        return File("PutFileSyncEntry", handle, session, first, second);
    }

    static int GetFile(void* handle, void* session, char* first, char* second)
    {
        return File("GetFileEntry", handle, session, first, second);
    }

    static int GetFileSync(void* handle, void* session, char* first, char* second)
    {
        return File("GetFileSyncEntry", handle, session, first, second);
    }

    static int SendJob(void* handle, void* session, TJobIdentification* job, char* path, char* name)
    {
        current->pointers = {job, path, name};
        if (current->onJob)
            current->onJob(*job, path, name);
        return WithSession("SendJobEntry", handle, session);
    }

    static STICKET_ACCESS const* CreateTicket(char const* path)
    {
        current->paths.emplace_back(path ? path : "(null)");
        return current->ticket ? current->ticket->Access() : nullptr;
    }

    static void DestroyTicket(STICKET_ACCESS const** ticket)
    {
        EXPECT_EQ(*ticket, current->ticket->Access());
        *ticket = nullptr;
        ++current->destroyed;
    }
};

FakeModule::FakeModule()
{
    current = this;
    table = {};
    table.QueryInterface = FAKE_ENTRIES::QueryInterface;
    table.Release = FAKE_ENTRIES::Release;
    table.Open = FAKE_ENTRIES::Open;
    table.InitializeEntry = FAKE_ENTRIES::Initialize;
    table.IsAliveEntry = FAKE_ENTRIES::IsAlive;
    table.GetLocalAddressEntry = FAKE_ENTRIES::GetLocalAddress;
    table.LoginEntry = FAKE_ENTRIES::Login;
    table.LogoutEntry = FAKE_ENTRIES::Logout;
    table.UninitializeEntry = FAKE_ENTRIES::Uninitialize;
    table.UninitializeAsyncEntry = FAKE_ENTRIES::UninitializeAsync;
    table.GetClientContainerEntry = FAKE_ENTRIES::GetClientContainer;
    table.GetTicketDataEntry = FAKE_ENTRIES::GetTicketData;
    table.SendCommandEntry = FAKE_ENTRIES::SendCommand;
    table.PutFileEntry = FAKE_ENTRIES::PutFile;
    table.GetFileEntry = FAKE_ENTRIES::GetFile;
    table.SendJobEntry = FAKE_ENTRIES::SendJob;
    table.PutFileSyncEntry = FAKE_ENTRIES::PutFileSync;
    table.GetFileSyncEntry = FAKE_ENTRIES::GetFileSync;
    table.STicketFactory = &factory;
    factory.CreateTicket = FAKE_ENTRIES::CreateTicket;
    factory.DestroyTicket = FAKE_ENTRIES::DestroyTicket;
}

FakeModule::~FakeModule()
{
    current = nullptr;
    hSTicketInstance = nullptr;
}

void* FakeModule::Instance() { return &m_instance; }

int FakeModule::Called(char const* entry, void* handle)
{
    EXPECT_EQ(handle, Handle()) << entry;
    return Answer(entry);
}

int FakeModule::Answer(char const* entry)
{
    calls.emplace_back(entry);
    auto const result = results.find(entry);
    return result == results.end() ? 0 : result->second;
}

void FakeModule::SpoilTheLiveTable()
{
    // No entry's own type fits them all; none but a failing test gets as far as a call.
    int (*const spoiled)() = []
    {
        ADD_FAILURE() << "called through the live table";
        return -1;
    };
    unsigned char words[sizeof table];
    for (std::size_t i = 0; i < sizeof words; i += sizeof spoiled)
        std::memcpy(words + i, &spoiled, sizeof spoiled);
    std::memcpy(&table, words, sizeof words);
}

BundleOnDisk EmptyBundle(std::filesystem::path const& folder)
{
    BundleOnDisk bundle(folder);
    bundle.LinkExecutable(SESSION_TEST_PLUGIN);
    return bundle;
}

WithModule::WithModule()
{
    EmptyBundle(folder.Path()).AddFactory(COMGUI_PLUGIN_TYPE_UUID, FirstUUID, "FirstFactory");
    LookIn(folder.Path());
}

WithModule::~WithModule() { UtilityObjects::SetPlugInsFolder(wxString()); }

void WithModule::LookIn(std::filesystem::path const& plugIns)
{
    UtilityObjects::SetPlugInsFolder(wxString::FromUTF8(plugIns.c_str()));
}

TLogin* WithModule::NewRecord()
{
    auto* const login = static_cast<TLogin*>(std::calloc(1, sizeof(TLogin)));
    login->nSize = sizeof(TLogin);
    return login;
}

WithManager::WithManager()
{
    manager.MacLogin();  // shows the record, and has no effect on a session
    own = module.login;
    module.login = nullptr;
    module.calls.clear();
}

bool WithManager::IsLoggedIn()
{
    int value = 0;
    return manager.GetParameter(fake.Access(), 0, 0, "Key", PARAM_INT, &value, -1) != -1;
}

bool WithManager::FakeIsTheContainer()
{
    int value = 0;
    fake.calls.clear();
    manager.GetSystemTicketParamForKey("Key", PARAM_INT, &value, -1);
    return fake.calls.size() == 1;
}

bool WithManager::IsInitialized()
{
    TLogin scratch = {};
    std::size_t const before = module.calls.size();
    manager.Initialize(&scratch, 0);
    return module.calls.size() == before;
}

bool WithManager::IsBackwardInitialized()
{
    TLogin scratch = {};
    std::size_t const before = module.calls.size();
    manager.InitializeBackward(&scratch, 0);
    return module.calls.size() == before;
}

void WithManager::LogIn()
{
    module.container = fake.Access();
    ASSERT_EQ(manager.Login(nullptr, nullptr, nullptr, -1), 0);
}
