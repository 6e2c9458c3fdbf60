// The function of a client that hears of changes, as the command "local.set.callback" brings it.
#pragma once

#include "comgui/module/Value.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <optional>
#include <vector>

namespace comgui::plugin
{
// What a client is told. The numbers are those that clients know.
enum ChangeKind : int
{
    ParametersChanged = 1,
    TicketCreated = 4,
    TicketDeleted = 5,
};

class Callback
{
public:
    using Function = void (*)(void* user, int kind, int argA, int argB, int code, void* data);

    Callback(Function function, void* user) : m_function(function), m_user(user) {}

    // What the command's ticket says; nothing if it names no function. ticket: not null.
    static std::optional<Callback> In(STICKET_ACCESS const& ticket);

    // Puts the id of the registration into the command's ticket, for the client. False if the ticket refuses
    // it.
    static bool PutId(STICKET_ACCESS const& ticket, int id);

    // Calls the client. parameters: what changed, no value for what was deleted; the client gets no table if
    // there is none. An exception of the client's passes.
    void Tell(int kind, int argA, int argB, int code, std::vector<Parameter> const& parameters) const;

    // The same with a table of the author's own, null for none: all records of a key have the same pointer.
    void Tell(int kind, int argA, int argB, int code, SETMULTIPAR* table) const;

private:
    Function m_function;
    void* m_user;
};
}  // namespace comgui::plugin
