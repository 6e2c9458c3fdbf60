// A login that a check needs and does not look at itself.
#pragma once

#include "comgui/access/MTICKET_ADMIN.h"
#include "comgui/session/TLogin.h"
#include "tools/comgui_validate/Trial.h"
#include <memory>
#include <string>
#include <vector>

namespace validate
{
// A record as a host makes it, for the user of the options.
class Record
{
public:
    explicit Record(Trial& trial);
    TLogin* operator->() const { return m_record.get(); }
    TLogin* Get() const { return m_record.get(); }

    int Initialize();
    int LogIn();
    int LogOut();

private:
    struct FREE
    {
        void operator()(TLogin* record) const;
    };

    Trial& m_trial;
    std::unique_ptr<TLogin, FREE> m_record;
    Module* m_module = nullptr;
};

// Logged in for as long as it lives. Skipped, if the login is refused: other checks look into that.
class Session
{
public:
    explicit Session(Trial& trial);
    ~Session();
    Session(Session const&) = delete;
    Session& operator=(Session const&) = delete;

    Trial& GetTrial() const { return m_trial; }
    void* Handle() const { return m_record->hSession; }
    TLogin* GetRecord() const { return m_record.Get(); }
    MTICKET_ACCESS const* Container();  // Skipped, if there is none
    int LogOut();
    void Forget() { m_isIn = false; }  // it is not to log out any more

    // The command as a host sends it; the text is a copy that may be written to.
    int Send(char const* command, int size, void* data);

private:
    Trial& m_trial;
    Record m_record;
    bool m_isIn = false;
    MTICKET_ACCESS const* m_container = nullptr;
};

// A ticket that may be written to: one of its own, which is deleted in the end, or else the one that the
// options name. Skipped, if there is neither.
class ScratchTicket
{
public:
    explicit ScratchTicket(Session& session);
    ~ScratchTicket();
    ScratchTicket(ScratchTicket const&) = delete;
    ScratchTicket& operator=(ScratchTicket const&) = delete;

    int Type() const { return m_type; }
    int Id() const { return m_id; }
    bool IsOwn() const { return m_isOwn; }
    void Forget() { m_isOwn = false; }  // somebody has deleted it

private:
    MTICKET_ACCESS const* const m_container;
    int m_type = -1;
    int m_id = -1;
    bool m_isOwn = false;
};

// The types in which a ticket of one's own is tried for, the likely ones first.
std::vector<int> TypesToTry(Trial const& trial);

std::string NameOf(int type, int id);  // "3, 1"
}  // namespace validate
