// The two families of views under one interface, so that each fact about reads and writes is told once and
// holds for both.
#pragma once

#include "comgui/access/MTICKET_MODIFY.h"
#include "comgui/access/MTICKET_READ.h"
#include "comgui/access/STICKET_MODIFY.h"
#include "comgui/access/STICKET_READ.h"
#include "comgui/testing/TicketFake.h"
#include <gtest/gtest.h>
#include <utility>

using comgui::test::CALL;
using comgui::test::ContainerFake;
using comgui::test::SLOT;
using comgui::test::TicketFake;

// A single ticket, through STICKET_READ and STICKET_MODIFY.
class SINGLE
{
public:
    static constexpr int Type = 0;
    static constexpr int Id = 0;

    TicketFake ticket;
    ContainerFake& fake = ticket.container;

    template <typename... Arguments>
    auto GetIntParameter(Arguments... arguments)
    {
        return Read().GetIntParameter(arguments...);
    }
    template <typename... Arguments>
    auto GetDoubleParameter(Arguments... arguments)
    {
        return Read().GetDoubleParameter(arguments...);
    }
    bool GetBoolParameter(int pos, char const* key, bool def)
    {
        return Read().GetBoolParameter(pos, key, def);
    }
    void* GetVoidParameter(int pos, char const* key, void* def)
    {
        return Read().GetVoidParameter(pos, key, def);
    }
    bool GetParameter(char const* key, wxString& value, int pos)
    {
        return Read().GetParameter(key, value, pos);
    }
    wxString GetWxStringParameter(int pos, char const* key, wxString const& def)
    {
        return Read().GetWxStringParameter(pos, key, def);
    }
    int ParameterType(char const* key, int pos) { return Read().ParameterType(key, pos); }
    wxString Decode(char const* value) { return Read().Decode(value); }

    template <typename Value>
    int SetParameter(char const* key, Value const& value, int pos)
    {
        return Modify().SetParameter(key, value, pos);
    }
    int DelParameter(char const* key, int pos) { return Modify().DelParameter(key, pos); }

    // How often the translator was asked for, and which of them answers.
    std::size_t TranslatorsAsked() const { return ticket.options.size(); }
    void SetTranslator(clFOLDER_VARIABLES* folders)
    {
        ticket.optionResult = folders ? 1 : 0;
        fake.folders = folders;
    }

    // Calls what takes a view, or the record, and then the arguments of a view's operation.
    template <typename Operation, typename... Arguments>
    auto OnRead(Operation operation, Arguments&&... arguments)
    {
        return operation(Read(), std::forward<Arguments>(arguments)...);
    }
    template <typename Operation, typename... Arguments>
    auto OnModify(Operation operation, Arguments&&... arguments)
    {
        return operation(Modify(), std::forward<Arguments>(arguments)...);
    }
    template <typename Operation, typename... Arguments>
    auto OnRecord(Operation operation, Arguments&&... arguments)
    {
        return operation(*ticket.Access(), std::forward<Arguments>(arguments)...);
    }

private:
    STICKET_READ const& Read() { return *STICKET_READ::Of(ticket.Access()); }
    STICKET_MODIFY const& Modify() { return *STICKET_MODIFY::Of(ticket.Access()); }
};

// A ticket of a container, through MTICKET_READ and MTICKET_MODIFY.
class CONTAINED
{
public:
    static constexpr int Type = 3;
    static constexpr int Id = 7;

    CONTAINED() { fake.AddTicket(Type, Id); }

    ContainerFake fake;

    template <typename... Arguments>
    auto GetIntParameter(Arguments... arguments)
    {
        return Read().GetIntParameter(Type, Id, arguments...);
    }
    template <typename... Arguments>
    auto GetDoubleParameter(Arguments... arguments)
    {
        return Read().GetDoubleParameter(Type, Id, arguments...);
    }
    bool GetBoolParameter(int pos, char const* key, bool def)
    {
        return Read().GetBoolParameter(Type, Id, pos, key, def);
    }
    void* GetVoidParameter(int pos, char const* key, void* def)
    {
        return Read().GetVoidParameter(Type, Id, pos, key, def);
    }
    bool GetParameter(char const* key, wxString& value, int pos)
    {
        return Read().GetParameter(Type, Id, key, value, pos);
    }
    wxString GetWxStringParameter(int pos, char const* key, wxString const& def)
    {
        return Read().GetWxStringParameter(Type, Id, pos, key, def);
    }
    int ParameterType(char const* key, int pos) { return Read().ParameterType(Type, Id, key, pos); }
    wxString Decode(char const* value) { return Read().Decode(value); }

    template <typename Value>
    int SetParameter(char const* key, Value const& value, int pos)
    {
        return Modify().SetParameter(Type, Id, key, value, pos);
    }
    int DelParameter(char const* key, int pos) { return Modify().DelParameter(Type, Id, key, pos); }

    std::size_t TranslatorsAsked() const
    {
        std::size_t asked = 0;
        for (CALL const& call : fake.calls)
            if (call.slot == SLOT::OPERATION)
            {
                EXPECT_EQ(call.op, 110);
                EXPECT_EQ(call.type, -1);  // of no particular ticket
                EXPECT_EQ(call.id, -1);
                ++asked;
            }
        return asked;
    }
    void SetTranslator(clFOLDER_VARIABLES* folders) { fake.folders = folders; }

    // Calls what takes a view, or the record, and then the arguments of a view's operation.
    template <typename Operation, typename... Arguments>
    auto OnRead(Operation operation, Arguments&&... arguments)
    {
        return operation(Read(), Type, Id, std::forward<Arguments>(arguments)...);
    }
    template <typename Operation, typename... Arguments>
    auto OnModify(Operation operation, Arguments&&... arguments)
    {
        return operation(Modify(), Type, Id, std::forward<Arguments>(arguments)...);
    }
    template <typename Operation, typename... Arguments>
    auto OnRecord(Operation operation, Arguments&&... arguments)
    {
        return operation(*fake.Access(), Type, Id, std::forward<Arguments>(arguments)...);
    }

private:
    MTICKET_READ const& Read() { return *MTICKET_READ::Of(fake.Access()); }
    MTICKET_MODIFY const& Modify() { return *MTICKET_MODIFY::Of(fake.Access()); }
};

template <typename Family>
class InBothFamilies : public testing::Test
{
protected:
    using FAMILY = Family;

    // The one call that a slot got.
    CALL OneCall() const
    {
        EXPECT_EQ(ticket.fake.calls.size(), 1u);
        return ticket.fake.calls.empty() ? CALL{} : ticket.fake.calls.front();
    }
    static CALL Get(PARAM_TYPE type, int pos)
    {
        return {SLOT::GET, Family::Type, Family::Id, "k", type, pos};
    }
    static CALL Set(PARAM_TYPE type, int pos)
    {
        return {SLOT::SET, Family::Type, Family::Id, "k", type, pos};
    }

    template <typename Value>
    void Put(Value value, int pos = -1)
    {
        ticket.fake.Put(Family::Type, Family::Id, "k", value, pos);
    }

    Family ticket;
};

using Families = testing::Types<SINGLE, CONTAINED>;
