// What ticket_form can do once it is logged in, one function a command. A Refusal tells what cannot be done.
#pragma once

#include "ServerSession.h"
#include "TicketForm.h"
#include <string>
#include <vector>

constexpr int WholeKey = -1;
constexpr int EveryType = -1;
constexpr int EveryTicket = -1;
constexpr int TicketTypes = 100;

struct OPTIONS
{
    std::string user = "admin";
    std::string password = "admin";
    std::string host = "localhost";
    int port = 50000;
    bool json = false;

    int type = EveryType;
    int id = EveryTicket;
    std::string key;
    std::vector<std::string> fields;  // KEY=VALUE
    std::string typeName;
    int pos = WholeKey;
    int events = 0;
    bool edit = false;
};

// What the commands work with, once logged in.
struct SESSION
{
    ComGUIManager& manager;
    TLogin* login;
    MTICKET_ACCESS const* container;

    TicketForm Open(OPTIONS const& options) const { return {manager, container, options.type, options.id}; }
};

void List(SESSION const& session, OPTIONS const& options);
void Keys(SESSION const& session, OPTIONS const& options);
void Get(SESSION const& session, OPTIONS const& options);
void Set(SESSION const& session, OPTIONS const& options);
void SetList(SESSION const& session, OPTIONS const& options);
void Delete(SESSION const& session, OPTIONS const& options);
void Watch(SESSION const& session, OPTIONS const& options, EndSignals const& end);
