// What a plug-in reports to a session, as its callback gets it.
#pragma once

#include "tools/comgui_validate/Session.h"
#include "tools/comgui_validate/Value.h"
#include <chrono>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

namespace validate
{
// A record of a table of changes: what may be looked at only during the callback is copied.
struct ReportedRecord
{
    void const* keyPointer;
    std::string key;
    PARAM_TYPE type;
    int position;
    std::optional<Value> value;  // none for what is no parameter
};

struct Report
{
    int kind;
    int code;
    std::vector<ReportedRecord> records;  // of kind 1
};

class Listener
{
public:
    // Registers a callback. The listener lives to the end of the process, since a plug-in may be late.
    static Listener& Begin(Session& session);

    int Result() const { return m_result; }  // of the command that registers
    int Id() const { return m_id; }
    void MustBeRegistered() const;  // Skipped, if it is not: notifications.register looks into that

    int Switch(int type, int id, bool on, char const* const* keys);
    void SwitchOn(int type, int id, std::vector<std::string> const& keys = {});  // MustBeRegistered
    void SwitchOff(int type, int id);

    // Waits for one that fits; all that came before it is thrown away. None after half of the check's time.
    std::optional<Report> Await(std::function<bool(Report const&)> const& fits);
    // A report of kind 1 that has the key.
    std::optional<Report> AwaitChange(std::string const& key);

    void Forget();  // what has come so far
    std::vector<Report> All() const;
    bool HadForeignUser() const;

private:
    explicit Listener(Session& session) : m_session(session) {}
    void Register();
    static void Callback(void* user, int kind, int argA, int argB, int code, void* data);
    void Take(Report report);

    Session& m_session;
    int m_result = -1;
    int m_id = -1;
    mutable std::mutex m_lock;
    std::condition_variable m_came;
    std::vector<Report> m_reports;
};

// Long enough for what must not come to have come.
inline constexpr std::chrono::milliseconds Silence(300);
}  // namespace validate
