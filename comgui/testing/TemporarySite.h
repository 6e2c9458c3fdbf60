// A site of the stand-in server for one test, and that server's own side of it: what any other client might
// do meanwhile is one line, and needs no login.
//
//     comgui::test::TemporarySite site;                    // admin/admin and operator/operator may log in
//     auto const job = site.Create(3, {{"Job/Copies", 2}});
//     ... log in, read job.id, subscribe ...
//     site.Put(job, "Job/Copies", 3);                      // the client hears of it
//     site.SetTrouble({"away for=2s sessions=lost"});      // and of this, sooner or later
//
// Failures throw std::runtime_error, so that a test never runs on half a fixture. For any thread, but for the
// making of a site, which sets variables of the environment.
#pragma once

#include "comgui/foundation/export.h"
#include "comgui/module/Value.h"
#include <filesystem>
#include <memory>
#include <string>
#include <vector>

namespace comgui::test
{
using plugin::Address;
using plugin::Parameter;
using plugin::Value;

class COMGUI_EXPORT TemporarySite
{
public:
    // Makes the site in a new folder. From now on this process, and the programs that it starts, find it
    // where clients look for a server: COMGUI_SITE names it.
    TemporarySite();

    // The folder goes at the end of the process: the plug-in that has opened the site cannot let go of it.
    ~TemporarySite();
    TemporarySite(TemporarySite const&) = delete;
    TemporarySite& operator=(TemporarySite const&) = delete;

    std::filesystem::path const& Folder() const;

    // Somebody who may log in from now on. role: 16 for an administrator. The user gets a ticket of type 17;
    // its id is the result.
    int AddUser(std::string const& name, std::string const& password, int role = 1);

    // Tickets as a client writes them: positions are those of the slots, -2 appends. Without a value a
    // parameter is deleted.
    Address Create(int type, std::vector<Parameter> const& parameters = {});
    void Write(Address ticket, std::vector<Parameter> const& parameters);  // as one change
    void Put(Address ticket, std::string const& key, Value const& value, int pos = -1);
    void Delete(Address ticket);

    // What the server has, whatever clients have been told; std::monostate for nothing. pos: from 0.
    Value Read(Address ticket, std::string const& key, int pos = 0) const;
    bool Exists(Address ticket) const;

    // Lets the server misbehave for its clients, by these rules instead of any before, from their next calls
    // on; docs/site.md tells what rules can say. None: it behaves. Throws std::invalid_argument for what is
    // no rule.
    void SetTrouble(std::vector<std::string> const& rules);

private:
    class Inside;
    std::unique_ptr<Inside> m_inside;
};
}  // namespace comgui::test
