// The behaviour that all makers of a STICKET_ACCESS share, as one test suite. To use it, instantiate
// TicketContract with a TICKET_MAKER and build TicketContract.cpp into the test program. The suite is
// stricter than STICKET_ACCESS.h: another plug-in may treat refused calls and invalid positions differently.
#pragma once

#include "comgui/ticket/STICKET_ACCESS.h"
#include <climits>
#include <functional>
#include <gtest/gtest.h>
#include <memory>
#include <string>
#include <vector>

namespace comgui::test
{
// An empty ticket that accepts writes.
class TICKET_SUBJECT
{
public:
    virtual ~TICKET_SUBJECT() = default;
    virtual STICKET_ACCESS const* Access() = 0;

    STICKET_OPTION_WHOAMI who{};  // the expected answer to STICKET_OP_WHOAMI
};

struct TICKET_MAKER
{
    char const* name;
    std::unique_ptr<TICKET_SUBJECT> (*make)();
};

class TicketContract : public testing::TestWithParam<TICKET_MAKER>
{
protected:
    TicketContract() : subject(GetParam().make()), access(subject->Access()) {}

    // These call the slots and change nothing in arguments or results.
    int Get(char const* key, PARAM_TYPE type, void* value, int pos = -1) const
    {
        return access->SGETPARAMETER(access->Instance, key, type, value, pos);
    }
    int Set(char const* key, PARAM_TYPE type, void const* value, int pos = -1) const
    {
        return access->SSETPARAMETER(access->Instance, key, type, value, pos);
    }
    int SetInt(char const* key, int value, int pos = -1) const { return Set(key, PARAM_INT, &value, pos); }
    int SetText(char const* key, std::string const& text, int pos = -1) const
    {
        return Set(key, PARAM_STRING, text.c_str(), pos);
    }
    int SetBytes(char const* key, std::string const& bytes, int pos = -1) const;
    int Delete(char const* key, int pos = -1) const { return Set(key, PARAM_NONE, nullptr, pos); }

    // -1, "none" or 0 for what cannot be read.
    int Int(char const* key, int pos = -1) const;
    std::string Text(char const* key, int pos = -1) const;
    std::string Bytes(char const* key, int pos = -1) const;
    unsigned long Count(char const* key) const;
    int Type(char const* key, int pos = -1) const;

    // One value of each type that can be stored: "K1" a pointer, "K2" an int, up to "K9".
    void SetEveryType() const;

    // A read of that type, or of each type, answers 0 and leaves all of the caller's bytes.
    void ExpectUnreadable(char const* key, PARAM_TYPE type, int pos) const;
    void ExpectUnreadable(char const* key, int pos) const;

    // One walked value as "key[pos]=value" for ints and texts, else as "key[pos] type". Walked expects the
    // walk to succeed and gives all lines.
    static std::string Line(char const* key, PARAM_TYPE type, void const* value, int pos);
    std::vector<std::string> Walked(char const* prefix = "", int limit = INT_MAX) const;

    using ACTION = std::function<bool(char const* key, PARAM_TYPE type, void const* value, int pos)>;
    int Walk(ACTION action, char const* prefix = "", int limit = INT_MAX) const;

    // Allocates blocks of the size of LongText, so that freed texts are overwritten.
    void Churn() const;

    std::unique_ptr<TICKET_SUBJECT> subject;
    STICKET_ACCESS const* access;
};
}  // namespace comgui::test
