#include "tests/module_kit/FakePlugIn.h"

#include <CoreFoundation/CoreFoundation.h>
#include <bit>
#include <cstring>
#include <gmock/gmock.h>

using testing::Each;
using testing::ElementsAre;
using testing::IsEmpty;
namespace plugin = comgui::plugin;

COMGUI_PLUGIN(ModuleKitTestFactory, fake::Module)

namespace
{
using Entries = PlugInTest;

void* const NoHandle = std::bit_cast<void*>(std::uintptr_t{0x10});
}  // namespace

TEST_F(Entries, TheFactory_MakesAnObjectThatHandsOutTheTable)
{
    auto const uuid = [](char const* text)
    {
        CFStringRef const string = CFStringCreateWithCString(nullptr, text, kCFStringEncodingUTF8);
        CFUUIDRef const made = CFUUIDCreateFromString(nullptr, string);
        CFRelease(string);
        return made;
    };
    CFUUIDRef const other = uuid("00000000-6CFC-11D8-A365-003065B1346E");
    EXPECT_EQ(ModuleKitTestFactory(nullptr, other), nullptr);
    CFUUIDRef const type = uuid(COMGUI_PLUGIN_TYPE_UUID);
    void* const object = ModuleKitTestFactory(nullptr, type);
    ASSERT_NE(object, nullptr);
    auto const* const its = *static_cast<ComGUIModuleInterface* const*>(object);
    COMGUI_UUID wanted{
        {0x33, 0xFC, 0x3B, 0x14, 0x6C, 0xFF, 0x11, 0xD8, 0xAB, 0x09, 0x00, 0x30, 0x65, 0xB1, 0x34, 0x6E}};
    void* out = nullptr;
    EXPECT_EQ(its->QueryInterface(object, wanted, &out), 0);
    EXPECT_EQ(out, object);
    EXPECT_EQ(its->Release(object), 1u);
    EXPECT_EQ(*static_cast<ComGUIModuleInterface**>(out), &table);
    wanted.bytes[0] = 0;
    void* nothing = nullptr;
    EXPECT_NE(its->QueryInterface(object, wanted, &nothing), 0);
    EXPECT_EQ(nothing, nullptr);
    EXPECT_EQ(its->Release(out), 0u);
    CFRelease(type);
    CFRelease(other);
}

TEST_F(Entries, Login_FillsInWhatTellsOfTheSessionAndNothingElse)
{
    TLogin const before = record;
    ASSERT_EQ(table.LoginEntry(hInstance, &record), 0);
    EXPECT_NE(record.hSession, nullptr);
    EXPECT_EQ(record.iClientStamp, 17);
    EXPECT_EQ(record.iUserRole, 16);
    EXPECT_STREQ(record.szLocalEndPoint, "10.0.0.1:50006");
    TLogin after = record;
    after.hSession = before.hSession;
    after.iClientStamp = before.iClientStamp;
    after.iUserRole = before.iUserRole;
    std::memcpy(after.szLocalEndPoint, before.szLocalEndPoint, sizeof after.szLocalEndPoint);
    EXPECT_EQ(std::memcmp(&after, &before, sizeof after), 0);
}

TEST_F(Entries, Login_RefusedByTheAuthor_LeavesTheRecord)
{
    RECORD wrong("ada", "wrong");
    TLogin const before = wrong;
    EXPECT_EQ(table.LoginEntry(hInstance, &wrong), plugin::LoginRefused);
    EXPECT_EQ(std::memcmp(&wrong, &before, sizeof before), 0);
}

TEST_F(Entries, Login_WithFieldsThatAreFull_TakesThemToTheLastByte)
{
    std::memset(record.szLocalAddress, 'x', sizeof record.szLocalAddress);
    std::memset(record.szLocalEndPoint, 'y', sizeof record.szLocalEndPoint);
    ASSERT_EQ(table.LoginEntry(hInstance, &record), 0);
    EXPECT_EQ(std::string(record.szLocalEndPoint), std::string(127, 'x'));
}

TEST_F(Entries, ARecordThatIsNone_IsAnInvalidArgument)
{
    TLogin wrong{};
    for (TLogin* const login : {static_cast<TLogin*>(nullptr), &wrong})
    {
        EXPECT_EQ(table.InitializeEntry(hInstance, login, 0), plugin::InvalidArgument);
        EXPECT_EQ(table.LoginEntry(hInstance, login), plugin::InvalidArgument);
        EXPECT_EQ(table.UninitializeEntry(hInstance, login), plugin::UnknownRecord);
    }
}

TEST_F(Entries, Uninitialize_UndoesInitializeOnce)
{
    EXPECT_EQ(table.UninitializeEntry(hInstance, &record), plugin::UnknownRecord);
    EXPECT_EQ(table.InitializeEntry(hInstance, &record, 0), 0);
    EXPECT_EQ(table.UninitializeAsyncEntry(hInstance, &record), 0);
    EXPECT_EQ(table.UninitializeEntry(hInstance, &record), plugin::UnknownRecord);
}

TEST_F(Entries, Open_WithoutAPlace_IsAnInvalidArgument)
{
    EXPECT_EQ(table.Open(nullptr), plugin::InvalidArgument);
}

TEST_F(Entries, AnInstanceThatIsNone_IsUnknownToEveryEntry)
{
    void* const hSession = LogIn();
    char text[] = "text";
    for (void* const i : {static_cast<void*>(nullptr), NoHandle, hSession, static_cast<void*>(&record)})
    {
        EXPECT_THAT(
            (std::vector<int>{
                table.InitializeEntry(i, &record, 0), table.IsAliveEntry(i, "localhost", fake::Port),
                table.LoginEntry(i, &record), table.LogoutEntry(i, hSession),
                table.UninitializeEntry(i, &record),
                table.GetTicketDataEntry(i, hSession, 0, 0, 0, nullptr, nullptr),
                table.SendCommandEntry(i, hSession, "known", 0, nullptr),
                table.PutFileEntry(i, hSession, text, text), table.GetFileEntry(i, hSession, text, text),
                table.SendJobEntry(i, hSession, nullptr, text, text),
                table.PutFileSyncEntry(i, hSession, text, text),
                table.GetFileSyncEntry(i, hSession, text, text), table.UninitializeAsyncEntry(i, &record)}),
            Each(plugin::UnknownInstance));
        EXPECT_EQ(table.GetClientContainerEntry(i, hSession), nullptr);
    }
    EXPECT_NE(ContainerOf(hSession), nullptr);
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

TEST_F(Entries, ASessionThatIsNone_IsUnknownToEveryEntry)
{
    void* const i = hInstance;
    void* const stale = LogIn();
    EXPECT_EQ(table.LogoutEntry(i, stale), 0);
    fake::Log::Take();
    char text[] = "text";
    for (void* const hSession :
         {static_cast<void*>(nullptr), NoHandle, stale, i, static_cast<void*>(&record)})
    {
        EXPECT_THAT((std::vector<int>{table.LogoutEntry(i, hSession),
                                      table.GetTicketDataEntry(i, hSession, 0, 0, 0, nullptr, nullptr),
                                      table.SendCommandEntry(i, hSession, "known", 0, nullptr),
                                      table.PutFileEntry(i, hSession, text, text),
                                      table.GetFileEntry(i, hSession, text, text),
                                      table.SendJobEntry(i, hSession, nullptr, text, text),
                                      table.PutFileSyncEntry(i, hSession, text, text),
                                      table.GetFileSyncEntry(i, hSession, text, text)}),
                    Each(plugin::UnknownSession));
        EXPECT_EQ(table.GetClientContainerEntry(i, hSession), nullptr);
    }
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

TEST_F(Entries, Logout_EndsTheSessionOnceAndLeavesTheOthers)
{
    void* const one = LogIn();
    void* const other = LogIn();
    EXPECT_NE(one, other);
    fake::Log::Take();
    EXPECT_EQ(table.LogoutEntry(hInstance, one), 0);
    EXPECT_EQ(table.LogoutEntry(hInstance, one), plugin::UnknownSession);
    EXPECT_THAT(fake::Log::Take(), ElementsAre("end"));
    EXPECT_NE(ContainerOf(other), nullptr);
}

TEST_F(Entries, ASessionThatHasEndedByItself_IsUnknown)
{
    void* const hSession = LogIn();
    fake::Session::hasEnded = true;
    EXPECT_EQ(ContainerOf(hSession), nullptr);
    EXPECT_EQ(table.SendCommandEntry(hInstance, hSession, "known", 0, nullptr), plugin::UnknownSession);
    EXPECT_EQ(table.LogoutEntry(hInstance, hSession), plugin::UnknownSession);
}

TEST_F(Entries, NullTexts_AreInvalidArguments)
{
    void* const hSession = LogIn();
    char text[] = "text";
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.pszUploadFolder = text;
    EXPECT_EQ(table.IsAliveEntry(hInstance, nullptr, fake::Port), plugin::InvalidArgument);
    EXPECT_EQ(table.GetLocalAddressEntry(hInstance, nullptr, 0), 0x0A000001u);
    EXPECT_EQ(table.SendCommandEntry(hInstance, hSession, nullptr, 0, nullptr), plugin::InvalidArgument);
    for (auto const entry :
         {table.PutFileEntry, table.GetFileEntry, table.PutFileSyncEntry, table.GetFileSyncEntry})
    {
        EXPECT_EQ(entry(hInstance, hSession, nullptr, text), plugin::InvalidArgument);
        EXPECT_EQ(entry(hInstance, hSession, text, nullptr), plugin::InvalidArgument);
    }
    EXPECT_EQ(table.SendJobEntry(hInstance, hSession, &job, nullptr, text), plugin::InvalidArgument);
    EXPECT_EQ(table.SendJobEntry(hInstance, hSession, &job, text, nullptr), plugin::InvalidArgument);
    EXPECT_EQ(table.SendJobEntry(hInstance, hSession, nullptr, text, text), plugin::InvalidArgument);
    job.pszUploadFolder = nullptr;
    EXPECT_EQ(table.SendJobEntry(hInstance, hSession, &job, text, text), plugin::InvalidArgument);
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

TEST_F(Entries, Transfers_ReachTheAuthorWithTheirTextsInOrder)
{
    void* const hSession = LogIn();
    char one[] = "one";
    char two[] = "two";
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.iJobArg1 = 5;
    job.pszUploadFolder = one;
    EXPECT_EQ(table.PutFileEntry(hInstance, hSession, one, two), 0);
    EXPECT_EQ(table.PutFileSyncEntry(hInstance, hSession, one, two), 0);
    EXPECT_EQ(table.GetFileEntry(hInstance, hSession, one, two), 0);
    EXPECT_EQ(table.GetFileSyncEntry(hInstance, hSession, one, two), 0);
    EXPECT_EQ(table.SendJobEntry(hInstance, hSession, &job, one, two), 0);
    int size = 0;
    EXPECT_EQ(table.GetTicketDataEntry(hInstance, hSession, 3, 1, 8, &size, nullptr), 0);
    EXPECT_EQ(size, 8);
    EXPECT_THAT(fake::Log::Take(),
                ElementsAre("put one two begun", "put one two complete", "get one two begun",
                            "get one two complete", "job 5 one two", "data of 3/1"));
}

TEST_F(Entries, Commands_ReachTheAuthorByTheirNames)
{
    void* const hSession = LogIn();
    TCommandRecord command{};
    command.nMagic = 0x49494949;
    command.nSize = sizeof command;
    command.iArgA = 3;
    char folder[] = "/tmp and more";
    auto const send = [&](char const* name, int size, void* data)
    { return table.SendCommandEntry(hInstance, hSession, name, size, data); };
    EXPECT_EQ(send("remote.system.isalive", 540, &command), 0);
    EXPECT_EQ(command.iResult, 7);
    EXPECT_EQ(send("remote.job.prepare", 540, &command), 0);
    EXPECT_EQ(command.iResult, 3);
    EXPECT_EQ(send("local.set.previewfolder", 4, folder), 0);
    EXPECT_EQ(send("local.set.thumbnailfolder", 999, folder), 0);
    EXPECT_EQ(send("known", 0, nullptr), 0);
    EXPECT_EQ(send("unknown", 0, nullptr), plugin::NotOffered);
    EXPECT_THAT(fake::Log::Take(), ElementsAre("preview /tmp", "thumbnail /tmp and more"));
}

TEST_F(Entries, CommandsWithoutWhatBelongsToThem_AreInvalidArguments)
{
    void* const hSession = LogIn();
    TCommandRecord command{};
    command.nMagic = 0x49494949;
    command.nSize = sizeof command;
    char text[] = "text";
    auto const send = [&](char const* name, int size, void* data)
    { return table.SendCommandEntry(hInstance, hSession, name, size, data); };
    for (char const* const name : {"remote.system.isalive", "remote.job.prepare"})
    {
        EXPECT_EQ(send(name, 540, nullptr), plugin::InvalidArgument);
        EXPECT_EQ(send(name, 539, &command), plugin::InvalidArgument);
        command.nMagic = 0;
        EXPECT_EQ(send(name, 540, &command), plugin::InvalidArgument);
        command.nMagic = 0x49494949;
        command.nSize = 0;
        EXPECT_EQ(send(name, 540, &command), plugin::InvalidArgument);
        command.nSize = sizeof command;
    }
    EXPECT_EQ(send("local.set.previewfolder", 0, text), plugin::InvalidArgument);
    EXPECT_EQ(send("local.set.previewfolder", 4, nullptr), plugin::InvalidArgument);
    EXPECT_EQ(send("local.set.callback", 0, nullptr), plugin::InvalidArgument);
}

TEST_F(Entries, TheFactoryOfTickets_OpensWhatTheAuthorKnows)
{
    STicketFactory const& factory = *table.STicketFactory;
    EXPECT_EQ(factory.CreateTicket("missing"), nullptr);
    STICKET_ACCESS const* ticket = factory.CreateTicket("file");
    ASSERT_NE(ticket, nullptr);
    char const* path = nullptr;
    EXPECT_EQ(ticket->SGETPARAMETER(ticket->Instance, "Path", PARAM_STRING, &path, -1), 1);
    EXPECT_STREQ(path, "file");
    fake::Log::Take();
    factory.DestroyTicket(&ticket);
    EXPECT_EQ(ticket, nullptr);
    factory.DestroyTicket(&ticket);
    factory.DestroyTicket(nullptr);
    EXPECT_THAT(fake::Log::Take(), ElementsAre("close"));
}

TEST_F(Entries, DestroyTicket_OfWhatIsNoneOfThese_DoesNothing)
{
    MTICKET_ACCESS const& container = *ContainerOf(LogIn());
    STICKET_ACCESS const foreign{};
    STICKET_ACCESS const* const given[] = {&foreign, reinterpret_cast<STICKET_ACCESS const*>(&container)};
    for (STICKET_ACCESS const* const ticket : given)
    {
        STICKET_ACCESS const* place = ticket;
        table.STicketFactory->DestroyTicket(&place);
        EXPECT_EQ(place, ticket);
    }
    EXPECT_THAT(fake::Log::Take(), IsEmpty());
}

namespace
{
// An author who has done no more than he must.
class BareSession : public plugin::Session
{
};

class BareModule : public plugin::Module
{
public:
    int IsAlive(std::string_view, int) override { return 0; }
    plugin::LoggedIn LogIn(plugin::Credentials const&) override { return {std::make_unique<BareSession>()}; }
};
}  // namespace

TEST(BareModuleOfTheKit, WhatIsNotOverridden_IsNotOffered)
{
    ComGUIModuleInterface const& table = plugin::PlugIn<BareModule>::Table();
    void* i = nullptr;
    ASSERT_EQ(table.Open(&i), 0);
    RECORD record;
    ASSERT_EQ(table.InitializeEntry(i, &record, 0), 0);
    ASSERT_EQ(table.LoginEntry(i, &record), 0);
    void* const s = record.hSession;
    EXPECT_EQ(table.GetLocalAddressEntry(i, "localhost", 1), 0x7F000001u);
    EXPECT_EQ(table.GetClientContainerEntry(i, s), nullptr);
    char text[] = "text";
    TCommandRecord command{};
    command.nMagic = 0x49494949;
    command.nSize = sizeof command;
    TJobIdentification job{};
    job.nSize = sizeof job;
    job.pszUploadFolder = text;
    EXPECT_THAT((std::vector<int>{table.GetTicketDataEntry(i, s, 0, 0, 0, nullptr, nullptr),
                                  table.SendCommandEntry(i, s, "unknown", 0, nullptr),
                                  table.SendCommandEntry(i, s, "remote.system.isalive", 540, &command),
                                  table.SendCommandEntry(i, s, "remote.job.prepare", 540, &command),
                                  table.SendCommandEntry(i, s, "local.set.previewfolder", 4, text),
                                  table.PutFileEntry(i, s, text, text), table.GetFileEntry(i, s, text, text),
                                  table.SendJobEntry(i, s, &job, text, text),
                                  table.PutFileSyncEntry(i, s, text, text),
                                  table.GetFileSyncEntry(i, s, text, text)}),
                Each(plugin::NotOffered));
    EXPECT_EQ(table.STicketFactory->CreateTicket("file"), nullptr);
    EXPECT_EQ(table.LogoutEntry(i, s), 0);
    EXPECT_EQ(table.UninitializeEntry(i, &record), 0);
}
