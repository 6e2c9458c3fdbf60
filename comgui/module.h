// The plug-in kit: what an author of a communication plug-in derives from, so that the plug-in is its
// server's logic and nothing else. Link comgui::module; docs/writing-a-module.md begins at the beginning.
//
//   Module          the plug-in: whether a server answers, the login, tickets outside any session
//   Session         what a client does once it is logged in: its tickets, commands, files and jobs
//   Container       the tickets of a session: values by ticket and key, tables, walks, operations
//   Ticket          one ticket outside any session; MemoryTicket is one in memory
//   Parameters      the values of one ticket, by the rules that hold for positions and deletions
//   Value           a value of any of the types that a ticket holds, with nothing for no value
//   KeySelection    the keys that a client has asked for
//   Notifications   tells clients of changes, on a thread of its own
//   Callback        the function of one client that hears of them
//   Kept            texts and numbers whose addresses a host holds on to
//   TicketSlots     the slots of a ticket as virtual functions, for authors who want no values in between
//   ContainerSlots  the same of a session's tickets
//   Called          what they have in common: a place for what all calls share, and one for exceptions
//   Refused         an exception that becomes a code
//   PlugIn          the table of entries over a Module, and COMGUI_PLUGIN, the factory that a bundle exports
//
// How a call comes in: the host calls a slot or entry of a table. The function there finds the object that
// the handle stands for; a handle that is stale or foreign is answered with 0 or a code, and never followed.
// It runs the author's virtual function with exceptions caught, and turns what it returns into what the host
// expects.
#pragma once

#include "comgui/module/Callback.h"
#include "comgui/module/Called.h"
#include "comgui/module/Codes.h"
#include "comgui/module/Container.h"
#include "comgui/module/ContainerSlots.h"
#include "comgui/module/Kept.h"
#include "comgui/module/KeySelection.h"
#include "comgui/module/Module.h"
#include "comgui/module/Notifications.h"
#include "comgui/module/Parameters.h"
#include "comgui/module/PlugIn.h"
#include "comgui/module/Session.h"
#include "comgui/module/Ticket.h"
#include "comgui/module/TicketSlots.h"
#include "comgui/module/Value.h"
