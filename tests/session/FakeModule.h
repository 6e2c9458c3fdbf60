// A communication module under a test's control, served to the library through a bundle on disk: it writes
// down every call of an entry and answers as it is told. One at a time; for one thread.
#pragma once

#include "comgui/session/ComGUIManager.h"
#include "comgui/session/TJobIdentification.h"
#include "comgui/testing/ContainerFake.h"
#include "comgui/testing/TemporaryFolder.h"
#include "comgui/testing/TicketFake.h"
#include "tests/support/BundleOnDisk.h"
#include <filesystem>
#include <functional>
#include <gtest/gtest.h>
#include <map>
#include <string>
#include <vector>

using comgui::test::ContainerFake;
using comgui::test::TemporaryFolder;
using comgui::test::TicketFake;

class FakeModule
{
public:
    FakeModule();
    ~FakeModule();
    FakeModule(FakeModule const&) = delete;
    FakeModule& operator=(FakeModule const&) = delete;

    // --- what it shall do --------------------------------------------------------------------------------
    bool givesInterface = true;
    bool setsHandle = true;                  // Open stores a handle; else every entry comes with null
    std::map<std::string, int> results;      // of the entries, by name; 0 where nothing stands
    unsigned int localAddress = 0x0A141EC8;  // 10.20.30.200
    MTICKET_ACCESS const* container = nullptr;
    std::function<void(TLogin&)> onLogin;  // fills in the record as a plug-in does
    std::function<void()> onLogout;
    TicketFake* ticket = nullptr;  // what the factory makes; none while null
    std::function<int(char const* command, int size, void* data)> onCommand;
    std::function<void(TJobIdentification& job, char const* path, char const* name)> onJob;

    // --- what it saw -------------------------------------------------------------------------------------
    std::vector<std::string> factories;  // that were asked for an instance
    std::string typeUUID;                // with which they were, as hex digits
    std::string interfaceUUID;
    std::vector<std::string> instanceCalls;  // of the factory's instance: QueryInterface and Release
    std::vector<std::string> calls;          // of entries, by name
    TLogin* login = nullptr;                 // the record that came last
    TLogin copy = {};                        // what that record held then
    int stamp = 0;                           // that came with it
    void* session = nullptr;                 // the session handle that came last
    std::string host;
    int port = 0;
    std::vector<int> ints;        // the arguments of GetTicketDataEntry behind the session
    std::vector<void*> pointers;  // its own or those of a file's or job's entry behind the session

    std::vector<std::string> paths;  // asked of the factory, "(null)" for a ticket in memory
    int destroyed = 0;               // tickets given back to it

    // The live table; the library copies it when a manager is made.
    // Static, and so are the two below, since a singleton manager keeps pointers from one test to the next.
    static inline ComGUIModuleInterface table = {};
    STicketFactory factory = {};

    void* Handle() { return setsHandle ? &m_handle : nullptr; }
    void* Instance();  // what a factory gives out

    // From here on a call through the live table fails the test; a copy made before stays good.
    static void SpoilTheLiveTable();

private:
    int Called(char const* entry, void* handle);
    int Answer(char const* entry);

    static inline char m_handle = 0;
    static inline ComGUIModuleInterface* m_instance = &table;   // COM: an instance's first word is its table
    static inline ComGUIModuleInterface* m_interface = &table;  // QueryInterface hands out another object
    friend struct FAKE_ENTRIES;
};

// A bundle with that module and no factory yet.
BundleOnDisk EmptyBundle(std::filesystem::path const& folder);

inline constexpr char FirstUUID[] = "11111111-1111-1111-1111-111111111111";
inline constexpr char SecondUUID[] = "22222222-2222-2222-2222-222222222222";

// A module in a bundle where the library looks for plug-ins.
class WithModule : public testing::Test
{
protected:
    WithModule();
    ~WithModule() override;

    // From here on the library looks for its plug-in there; in an empty folder it finds none.
    static void LookIn(std::filesystem::path const& plugIns);
    void LoseTheBundle() { LookIn(empty.Path()); }

    // A record that a manager may free.
    static TLogin* NewRecord();

    FakeModule module;
    TemporaryFolder folder;
    TemporaryFolder empty;
};

// The same with a manager that has opened it. module.calls begins behind that.
class WithManager : public WithModule
{
protected:
    WithManager();

    // A manager that is logged in with the fake container.
    void LogIn();

    // -1 from a guarded call tells.
    bool IsLoggedIn();

    // Whether the session forms use the fake; only to be asked when there is a container.
    bool FakeIsTheContainer();

    // Whether Initialize of that family does nothing. If it does something, it takes a port.
    bool IsInitialized();
    bool IsBackwardInitialized();

    ContainerFake fake;
    ComGUIManager manager;
    TLogin* own = nullptr;  // the manager's record
};
