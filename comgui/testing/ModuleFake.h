// A communication plug-in in the test's own process: a server of tickets in memory that writes down what a
// client calls, and answers as it is told. No server runs, and no bundle has to be installed.
//
//     comgui::test::ModuleFake module;
//     module.Use();                                        // from now on the library finds this one
//     auto const job = module.Create(3, {{"Job/Copies", 2}});
//     module.Answer("PutFileSyncEntry", 116);              // the next transfers fail
//     ... what is to be tested logs in, reads, writes, subscribes ...
//     EXPECT_THAT(module.Calls(), Contains("MSETMULTIPAR 3/1 Job/Copies[-1]=int 3"));
//
// Whoever logs in is an administrator, at any host and port. Files and jobs are taken and go nowhere. One at
// a time in a process; the library looks for its plug-in once, so it has to be used before the first session.
// For any thread.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/host/UtilityObjects.h"
#include "comgui/module/Value.h"
#include <filesystem>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace comgui::test
{
using plugin::Address;
using plugin::Parameter;
using plugin::Value;

class COMGUI_EXPORT ModuleFake
{
public:
    ModuleFake();

    // From then on every call fails, also of who is logged in, and OnCall's work is gone; it must not run.
    ~ModuleFake();
    ModuleFake(ModuleFake const&) = delete;
    ModuleFake& operator=(ModuleFake const&) = delete;

    // Of a program with libcomgui_host; another host is told where plug-ins are: in PlugIns().
    void Use() const { UtilityObjects::SetPlugInsFolder(wxString::FromUTF8(PlugIns().c_str())); }
    std::filesystem::path PlugIns() const;

    // The server's own side: what another client would do, without a trace in Calls(). Sessions hear of it.
    // Throws std::runtime_error for what cannot be done. Positions are those of the slots; no value deletes.
    Address Create(int type, std::vector<Parameter> const& parameters = {});
    void Put(Address ticket, std::string const& key, Value const& value, int pos = -1);
    void Delete(Address ticket);
    Value Read(Address ticket, std::string const& key, int pos = 0) const;
    bool Exists(Address ticket) const;

    // What happened, in order, with a slot's or entry's name: "LoginEntry admin", "MGETPARAMETER 3/1
    // Job/Name[-1]", "MSETMULTIPAR 3/1 Job/Copies[-1]=int 3", "MOPERATION 3/1 open", "SendCommandEntry
    // local.set.callback", "PutFileSyncEntry /tmp/a $(TEMP)/a". A slot of a single ticket appears as the
    // container's that does the same; SOPTION does not appear, nor what the kit answers by itself.
    std::vector<std::string> Calls() const;
    void ForgetCalls();

    // From now on calls of that name answer that code, and do nothing else; 0 takes it back. Of a slot every
    // code but 0 is a failure. A command goes by its own name. Throws std::invalid_argument for what is no
    // name in Calls() or of a command.
    void Answer(std::string const& call, int code);

    // Called on the client's thread before each call, with its line; null for nothing. May wait, and use this
    // object.
    void OnCall(std::function<void(std::string const& call)> work);

private:
    class Inside;
    std::shared_ptr<Inside> m_inside;

    friend class FakePlugIn;
};
}  // namespace comgui::test
