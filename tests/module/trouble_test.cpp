// What a client gets to see of a server that was told to misbehave, through the table of the bundle.
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include "standin/module/ModuleCodes.h"
#include "tests/module/NotificationListener.h"
#include "tests/support/Files.h"
#include <chrono>
#include <filesystem>
#include <gmock/gmock.h>
#include <thread>

using namespace standin;
using namespace std::chrono_literals;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

namespace
{
using Clock = std::chrono::steady_clock;

class Trouble : public ClientTest
{
protected:
    // Some of the rules end the sessions that are open.
    ~Trouble() override
    {
        CLIENT const last(*this, LogIn());
        Follow(last, "");
        last.Logout();
        admin.Logout();
        other.Logout();
    }

    static void Follow(CLIENT const& client, std::string const& rules)
    {
        MTICKET_ACCESS const* const access = client.Access();
        EXPECT_EQ(
            access->MSETPARAMETER(access->Instance, 0, 0, "System/Trouble", PARAM_STRING, rules.c_str(), -1),
            1);
    }
    void Follow(std::string const& rules) const { Follow(admin, rules); }

    template <typename Work>
    static std::chrono::milliseconds TimeOf(Work const& work)
    {
        auto const begin = Clock::now();
        work();
        return std::chrono::duration_cast<std::chrono::milliseconds>(Clock::now() - begin);
    }

    int Command(char const* name, void* data, int size = 0) const
    {
        return module->SendCommandEntry(module.Instance(), other.Session(), name, size, data);
    }
    int IsAliveCommand() const
    {
        TCommandRecord record{};
        record.nMagic = 0x49494949;
        record.nSize = sizeof record;
        return Command("remote.system.isalive", &record, sizeof record);
    }
    using ENTRY = int (*)(void*, void*, char*, char*);
    int Carry(ENTRY entry, std::string source, std::string target) const
    {
        return entry(module.Instance(), other.Session(), source.data(), target.data());
    }
    int Put(std::string const& target = "$(TEMP)/a") const
    {
        return Carry(module->PutFileSyncEntry, local, target);
    }
    int Fetch() const { return Carry(module->GetFileSyncEntry, "$(TEMP)/a", folder.Path() / "fetched"); }
    int SendJob() const
    {
        char upload[] = "$(UPLOADJOB)";
        char name[] = "job.pdf";
        std::string path = local;
        TJobIdentification record{};
        record.nSize = sizeof record;
        record.pszUploadFolder = upload;
        return module->SendJobEntry(module.Instance(), other.Session(), &record, path.data(), name);
    }
    int TicketData() const
    {
        char buffer[65536];
        int size = sizeof buffer;
        return module->GetTicketDataEntry(module.Instance(), other.Session(), 3, 1, 0, &size, buffer);
    }
    int CodeOfLogin(char const* user) const
    {
        RECORD record(user, user);
        EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), 0);
        int const code = module->LoginEntry(module.Instance(), &record);
        EXPECT_EQ(module->LogoutEntry(module.Instance(), record.hSession),
                  code == 0 ? 0 : MODULE_UNKNOWN_SESSION);
        module->UninitializeEntry(module.Instance(), &record);
        return code;
    }

    std::string const local = [this]
    {
        std::string const path = folder.Path() / "local";
        WriteFile(path, "some bytes");
        return path;
    }();
};
}  // namespace

TEST_F(Trouble, AnEntryThatIsToFail_AnswersTheCodeOfTheRule)
{
    struct
    {
        char const* name;
        std::function<int()> call;
    } const entries[] = {
        {"IsAliveEntry", [&] { return module->IsAliveEntry(module.Instance(), "localhost", 50000); }},
        {"InitializeEntry",
         [&]
         {
             RECORD record;
             int const code = module->InitializeEntry(module.Instance(), &record, 0);
             module->UninitializeEntry(module.Instance(), &record);
             return code;
         }},
        {"LoginEntry", [&] { return CodeOfLogin("operator"); }},
        {"GetTicketDataEntry", [&] { return TicketData(); }},
        {"SendCommandEntry", [&] { return IsAliveCommand(); }},
        {"remote.system.isalive", [&] { return IsAliveCommand(); }},
        {"PutFileEntry", [&] { return Carry(module->PutFileEntry, local, "$(TEMP)/b"); }},
        {"PutFileSyncEntry", [&] { return Put(); }},
        {"GetFileEntry", [&] { return Carry(module->GetFileEntry, "$(TEMP)/a", folder.Path() / "b"); }},
        {"GetFileSyncEntry", [&] { return Fetch(); }},
        {"SendJobEntry", [&] { return SendJob(); }},
    };
    admin.Create(3, 1);
    for (auto const& entry : entries)
    {
        SCOPED_TRACE(entry.name);
        EXPECT_EQ(entry.call(), 0);
        Follow("fail code=4711 call=" + std::string(entry.name));
        EXPECT_EQ(entry.call(), 4711);
        Follow("");
        EXPECT_EQ(entry.call(), 0);
    }
}

TEST_F(Trouble, ASlotThatIsToFail_AnswersZero)
{
    admin.Create(3, 1);
    CLIENT const writer(*this, LogIn());
    STICKET_ACCESS const* const ticket = writer.Open(3, 1);
    MTICKET_ACCESS const* const all = writer.Access();
    LISTENER listener;
    int const id = writer.Register(listener);
    int value = 7;
    GETMULTIPAR reads[2]{};
    SETMULTIPAR writes[2]{};
    reads[0].key = writes[0].key = "K";
    reads[0].type = writes[0].type = PARAM_INT;
    reads[0].value = &value;
    writes[0].value = &value;
    reads[0].pos = writes[0].pos = -1;
    auto const onTicket = [](void*, int, int, STICKET_ACCESS const*) { return true; };
    auto const onValue = [](void*, char const*, PARAM_TYPE, void const*, int) { return true; };
    STICKET_OPTION_WHOAMI who{};
    int next = 100;
    struct
    {
        char const* name;
        std::function<int()> call;
    } const slots[] = {
        {"MSETPARAMETER", [&] { return writer.Write(3, 1, "K", 7); }},
        {"MGETPARAMETER", [&] { return writer.Read(3, 1, "K") == 7; }},
        {"MGETMULTIPAR", [&] { return all->MGETMULTIPAR(all->Instance, 3, 1, reads); }},
        {"MSETMULTIPAR", [&] { return all->MSETMULTIPAR(all->Instance, 3, 1, writes); }},
        {"MWALKTICKETS", [&] { return all->MWALKTICKETS(all->Instance, onTicket, nullptr, 3); }},
        {"MOPERATION", [&] { return writer.CreateNext(3) >= 0; }},
        {"MENDISNOTIF", [&] { return writer.Enable(3, 1, id); }},
        {"MCREATETICKET", [&] { return writer.Create(3, ++next) != nullptr; }},
        {"SSETPARAMETER",
         [&] { return ticket->SSETPARAMETER(ticket->Instance, "K", PARAM_INT, &value, -1); }},
        {"SGETPARAMETER",
         [&] { return ticket->SGETPARAMETER(ticket->Instance, "K", PARAM_INT, &value, -1); }},
        {"SGETMULTIPAR", [&] { return ticket->SGETMULTIPAR(ticket->Instance, reads); }},
        {"SSETMULTIPAR", [&] { return ticket->SSETMULTIPAR(ticket->Instance, writes); }},
        {"SWALKPARAMETERS",
         [&] { return ticket->SWALKPARAMETERS(ticket->Instance, onValue, nullptr, "", 99); }},
        {"SOPTION", [&] { return ticket->SOPTION(ticket->Instance, STICKET_OP_WHOAMI, &who); }},
    };
    for (auto const& slot : slots)
    {
        SCOPED_TRACE(slot.name);
        EXPECT_EQ(slot.call(), 1);
        // nth: the rules themselves are taken back by a write
        Follow("fail nth=1 call=" + std::string(slot.name));
        EXPECT_EQ(slot.call(), 0);
        EXPECT_EQ(slot.call(), 1);
        Follow("");
    }
    writer.Logout();
}

TEST_F(Trouble, AReadThatFails_LeavesItsValue_AndATableHasNoRecordThatIsOk)
{
    admin.Create(3, 1);
    admin.Write(3, 1, "K", 7);
    Follow("fail call=?GET*");
    EXPECT_EQ(admin.Read(3, 1, "K"), -1);
    int value = 5;
    GETMULTIPAR reads[2]{};
    reads[0].key = "K";
    reads[0].type = PARAM_INT;
    reads[0].value = &value;
    reads[0].pos = -1;
    reads[0].ok = true;
    EXPECT_EQ(admin.Access()->MGETMULTIPAR(admin.Access()->Instance, 3, 1, reads), 0);
    EXPECT_FALSE(reads[0].ok);
    EXPECT_EQ(value, 5);
}

TEST_F(Trouble, Reason_NamesTheCallAndWhoWantedItToFail)
{
    Follow("fail user=operator");
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), -1);
    EXPECT_EQ(TakeReason(module), "MGETPARAMETER: refused, as System/Trouble says");
    EXPECT_EQ(IsAliveCommand(), MODULE_FAILED);
    EXPECT_EQ(TakeReason(module), "remote.system.isalive: refused, as System/Trouble says");
}

TEST_F(Trouble, OneUser_IsStruckAlone)
{
    Follow("fail user=operator");
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), -1);
    EXPECT_EQ(admin.Read(0, 0, "System/MasterSOAPPort"), 50000);
    EXPECT_EQ(CodeOfLogin("operator"), MODULE_FAILED);
    EXPECT_EQ(CodeOfLogin("admin"), 0);
}

TEST_F(Trouble, NthCall_IsStruckAlone)
{
    Follow("fail user=operator call=MGETPARAMETER nth=2");
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), 50000);
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), -1);
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), 50000);
}

TEST_F(Trouble, DelayedCall_SucceedsLater)
{
    Follow("delay by=300ms user=operator times=1");
    EXPECT_GE(TimeOf([&] { EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), 50000); }), 300ms);
}

TEST_F(Trouble, RuleWithAnEnd_EndsByItself)
{
    auto const end = Clock::now() + 2s;
    Follow("fail user=operator for=2s");
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), -1);
    std::this_thread::sleep_until(end + 10ms);
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), 50000);
}

TEST_F(Trouble, ServerThatIsAway_AnswersNothing_AndIsBackWithItsSessions)
{
    admin.Create(3, 1);
    auto const back = Clock::now() + 2s;
    Follow("away for=2s");
    EXPECT_EQ(other.Read(3, 1, "K"), -1);
    EXPECT_EQ(other.Open(0, 0), nullptr);
    EXPECT_EQ(IsAliveCommand(), MODULE_SITE_UNAVAILABLE);
    EXPECT_EQ(module->IsAliveEntry(module.Instance(), "localhost", 50000), MODULE_SITE_UNAVAILABLE);
    EXPECT_EQ(Put(), MODULE_SITE_UNAVAILABLE);
    RECORD record;
    EXPECT_EQ(module->InitializeEntry(module.Instance(), &record, 0), MODULE_SITE_UNAVAILABLE);
    std::this_thread::sleep_until(back + 10ms);
    EXPECT_EQ(other.Read(0, 0, "System/MasterSOAPPort"), 50000);
    EXPECT_EQ(IsAliveCommand(), 0);
    EXPECT_EQ(CodeOfLogin("operator"), 0);
}

TEST_F(Trouble, ServerThatStartsAnew_KnowsNoneOfItsSessions)
{
    CLIENT const old(*this, LogIn());
    LISTENER listener;
    old.Enable(0, 0, old.Register(listener));
    STICKET_ACCESS const* const ticket = old.Open(0, 0);
    auto const back = Clock::now() + 2s;
    Follow("away sessions=lost for=2s");
    EXPECT_EQ(old.Read(0, 0, "System/MasterSOAPPort"), -1);
    EXPECT_EQ(IsAliveCommand(), MODULE_SITE_UNAVAILABLE);
    EXPECT_EQ(IsAliveCommand(), MODULE_SITE_UNAVAILABLE) << "while it is away nobody can tell what it knows";
    std::this_thread::sleep_until(back + 10ms);
    EXPECT_EQ(old.Read(0, 0, "System/MasterSOAPPort"), -1);
    int value = 0;
    EXPECT_EQ(ticket->SGETPARAMETER(ticket->Instance, "System/MasterSOAPPort", PARAM_INT, &value, -1), 0);
    EXPECT_EQ(IsAliveCommand(), MODULE_UNKNOWN_SESSION);
    EXPECT_EQ(old.Logout(), MODULE_UNKNOWN_SESSION);

    CLIENT const anew(*this, LogIn());
    EXPECT_EQ(anew.Read(0, 0, "System/MasterSOAPPort"), 50000);
    anew.Write(0, 0, "K", 7);
    EXPECT_THAT(listener.Calls(), testing::Not(testing::Contains(HasSubstr("K@-1=7"))));
    anew.Logout();
}

class TroubledNotifications : public Trouble
{
protected:
    TroubledNotifications()
    {
        admin.Create(3, 1);
        EXPECT_EQ(other.Enable(3, 1, m_id), 1);
    }
    ~TroubledNotifications() override { other.Logout(); }

    int Id() const { return m_id; }
    void Write(int value) { EXPECT_EQ(admin.Write(3, 1, "K", value), 1); }

    LISTENER listener;

private:
    int const m_id = other.Register(listener);
};

TEST_F(TroubledNotifications, Late_ComeLater_InTheirOrder)
{
    Follow("late by=300ms nth=1");
    auto const took = TimeOf(
        [&]
        {
            Write(1);
            Write(2);
            EXPECT_THAT(listener.Wait(2), ElementsAre("changed 3/1 K@-1=1", "changed 3/1 K@-1=2"));
        });
    EXPECT_GE(took, 300ms);
}

TEST_F(TroubledNotifications, Late_AreNotToldAnyMore_OnceSwitchedOff)
{
    Follow("late by=200ms");
    Write(1);
    EXPECT_EQ(other.Disable(3, 1, Id()), 1);
    std::this_thread::sleep_for(300ms);
    EXPECT_THAT(listener.Calls(), IsEmpty());
}

TEST_F(TroubledNotifications, Twice_ComeTwice)
{
    Follow("twice nth=2");
    Write(1);
    Write(2);
    Write(3);
    EXPECT_THAT(listener.Wait(4), ElementsAre("changed 3/1 K@-1=1", "changed 3/1 K@-1=2",
                                              "changed 3/1 K@-1=2", "changed 3/1 K@-1=3"));
}

TEST_F(TroubledNotifications, Lost_DoNotCome)
{
    Follow("lost user=operator nth=2");
    Write(1);
    Write(2);
    Write(3);
    EXPECT_THAT(listener.Wait(2), ElementsAre("changed 3/1 K@-1=1", "changed 3/1 K@-1=3"));
}

TEST_F(TroubledNotifications, Swapped_ComeBehindTheNextOne)
{
    Follow("swapped nth=1");
    Write(1);
    Write(2);
    Write(3);
    EXPECT_THAT(listener.Wait(3),
                ElementsAre("changed 3/1 K@-1=2", "changed 3/1 K@-1=1", "changed 3/1 K@-1=3"));
}

TEST_F(TroubledNotifications, EachSwapped_AreToldInPairs)
{
    Follow("swapped share=100%");
    for (int i = 1; i <= 4; ++i)
        Write(i);
    EXPECT_THAT(listener.Wait(4), ElementsAre("changed 3/1 K@-1=2", "changed 3/1 K@-1=1",
                                              "changed 3/1 K@-1=4", "changed 3/1 K@-1=3"));
}

TEST_F(TroubledNotifications, SwappedWithoutANextOne_ComesAfterAll)
{
    Follow("swapped times=1");
    Write(1);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=1"));
}

TEST_F(TroubledNotifications, WhatHappensWhileTheServerIsAway_IsNeverTold)
{
    EXPECT_EQ(other.Enable(0, 0, Id()), 1);
    auto const back = Clock::now() + 2s;
    Follow("away for=2s");  // a change that he would be told of
    std::this_thread::sleep_until(back + 10ms);
    Write(2);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=2"));
}

TEST_F(TroubledNotifications, WhatWaits_WhenTheServerGoes_IsNeverTold)
{
    Follow("late by=500ms nth=1");
    Write(1);
    Follow("away for=2s");
    std::this_thread::sleep_for(2s + 10ms);
    Write(2);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=2"));
}

TEST_F(TroubledNotifications, BehindOneThatIsLateAndWithdrawn_DoNotWait)
{
    Follow("late by=10m nth=1");
    Write(1);
    EXPECT_EQ(other.Disable(3, 1, Id()), 1);
    EXPECT_EQ(other.Enable(3, 1, Id()), 1);
    Write(2);
    EXPECT_THAT(listener.Wait(1), ElementsAre("changed 3/1 K@-1=2"));
}

TEST_F(TroubledNotifications, SwappedAndTwice_AreWithdrawnAsOthersAre)
{
    Follow("swapped\ntwice");
    Write(1);
    EXPECT_EQ(other.Disable(3, 1, Id()), 1);
    std::size_t const told = listener.Calls().size();
    std::this_thread::sleep_for(1100ms);
    EXPECT_EQ(listener.Calls().size(), told);
    Follow("");
    EXPECT_EQ(other.Enable(3, 1, Id()), 1);
    Write(2);
    EXPECT_EQ(listener.Wait(told + 1).back(), "changed 3/1 K@-1=2");
}

TEST_F(TroubledNotifications, EndsOfTransfers_AreNotificationsToo)
{
    Follow("lost nth=1");
    EXPECT_EQ(Carry(module->PutFileEntry, local, "$(TEMP)/a"), 0);
    EXPECT_EQ(Carry(module->PutFileEntry, local, "$(TEMP)/b"), 0);
    auto const told = listener.Wait(1);
    ASSERT_EQ(told.size(), 1u);
    EXPECT_THAT(told[0], HasSubstr("$(TEMP)/b"));
}

TEST_F(Trouble, TransferThatStalls_GoesOnAfterwards)
{
    Follow("stall by=300ms times=1");
    EXPECT_GE(TimeOf([&] { EXPECT_EQ(Put(), 0); }), 300ms);
    EXPECT_EQ(Fetch(), 0);
    EXPECT_EQ(ContentOf(folder.Path() / "fetched"), "some bytes");
}

TEST_F(Trouble, TransferThatStalls_IsAsFarAsItWasToBe)
{
    WriteFile(local, std::string(100'000, 'x'));
    Follow("stall by=10m at=30% times=1");
    int code = 0;
    std::thread transfer([&] { code = Put(); });
    TICKET_FACTORY const factory;
    TICKET const ticket(factory, nullptr);
    long long done = 0;
    for (auto const end = Clock::now() + 20s; done == 0 && Clock::now() < end;)
    {
        EXPECT_EQ(Command("local.get.progress", const_cast<STICKET_ACCESS*>(ticket.Access())), 0);
        ticket.Get("Transfer/Done", PARAM_INT64, &done);
    }
    EXPECT_EQ(done, 30'000);
    EXPECT_EQ(other.Logout(), 0);
    transfer.join();
    EXPECT_EQ(code, MODULE_TRANSFER_CUT);
}

TEST_F(Trouble, TransferUnderWay_WhenTheServerGoes_IsCut)
{
    Follow("stall by=500ms");
    std::atomic<int> code = -1;
    std::thread transfer([&] { code = Put(); });
    std::this_thread::sleep_for(100ms);
    Follow("away for=2s");
    transfer.join();
    EXPECT_THAT(code.load(), testing::AnyOf(MODULE_TRANSFER_CUT, MODULE_SITE_UNAVAILABLE));
    EXPECT_FALSE(std::filesystem::exists(folder.Path() / "site/temp/a"));
    std::this_thread::sleep_for(2s);
}

TEST_F(Trouble, TransferThatStalls_CanBeCut)
{
    Follow("stall by=10m");
    int code = 0;
    std::thread transfer([&] { code = Put(); });
    while (!std::filesystem::exists(folder.Path() / "site" / "temp") ||
           std::filesystem::is_empty(folder.Path() / "site" / "temp"))
        std::this_thread::sleep_for(1ms);
    EXPECT_EQ(other.Logout(), 0);
    transfer.join();
    EXPECT_EQ(code, MODULE_TRANSFER_CUT);
    Follow("");
}

TEST_F(Trouble, FullDisk_TakesNothing_AndGivesEverything)
{
    EXPECT_EQ(Put(), 0);
    admin.Create(3, 1);
    admin.Write(3, 1, "K", 7);
    testing::internal::CaptureStderr();
    auto const end = Clock::now() + 3s;
    Follow("full for=3s");
    EXPECT_EQ(admin.Write(3, 1, "K", 8), 0);
    EXPECT_THAT(TakeReason(module), HasSubstr("disk of the site's database is full"));
    EXPECT_EQ(admin.Read(3, 1, "K"), 7);
    EXPECT_EQ(admin.Create(3, 2), nullptr);
    EXPECT_EQ(Put("$(TEMP)/b"), MODULE_TARGET_UNWRITABLE);
    EXPECT_THAT(TakeReason(module), HasSubstr("the server's disk is full"));
    EXPECT_NE(SendJob(), 0);
    EXPECT_EQ(Fetch(), 0);
    std::this_thread::sleep_until(end + 10ms);
    EXPECT_EQ(admin.Write(3, 1, "K", 8), 1);
    EXPECT_EQ(Put("$(TEMP)/b"), 0);
    testing::internal::GetCapturedStderr();
}
