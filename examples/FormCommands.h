// What ticket_form can do once it is logged in, one function a command. A Refusal tells what cannot be done.
#pragma once

#include "CommandLine.h"
#include "EndSignals.h"
#include <string>
#include <vector>

constexpr int EveryType = -1;
constexpr int EveryTicket = -1;

struct OPTIONS
{
    LOGIN login;
    bool json = false;

    comgui::TicketAddress ticket{EveryType, EveryTicket};
    std::string key;
    std::vector<std::string> fields;  // KEY=VALUE
    std::string typeName;
    int pos = comgui::WholeKey;
    int events = 0;
    bool edit = false;
};

void ListTickets(comgui::Connection& connection, OPTIONS const& options);
void Keys(comgui::Connection& connection, OPTIONS const& options);
void Get(comgui::Connection& connection, OPTIONS const& options);
void Set(comgui::Connection& connection, OPTIONS const& options);
void SetList(comgui::Connection& connection, OPTIONS const& options);
void Delete(comgui::Connection& connection, OPTIONS const& options);
void Watch(comgui::Connection& connection, OPTIONS const& options, EndSignals const& end);
