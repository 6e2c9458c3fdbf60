// A ticket as a form shows it: keys with their types and values, read and written through the session's
// operations, whatever types the ticket has. Like the manager, for one thread. What cannot be done throws a
// Refusal.
#pragma once

#include "FormValue.h"
#include <nlohmann/json.hpp>
#include <string>
#include <vector>

// A value, null where there is none; of a list all of its values.
using Json = nlohmann::ordered_json;

// As JSON on one line, harmless on a terminal, whatever bytes the texts have.
std::string Line(Json const& value);

struct FIELD
{
    std::string key;
    PARAM_TYPE type = PARAM_NONE;         // PARAM_COUNT: a list
    PARAM_TYPE elementType = PARAM_NONE;  // of a list, the type of the first value it has
};

class TicketForm
{
public:
    // Opens the ticket, and closes it at the end. The container is of a session that is logged in.
    TicketForm(ComGUIManager& manager, MTICKET_ACCESS const* container, int type, int id);
    ~TicketForm();
    TicketForm(TicketForm const&) = delete;
    TicketForm& operator=(TicketForm const&) = delete;

    std::vector<std::string> Keys() const;

    FIELD Field(std::string const& key) const;
    bool Has(std::string const& key, FIELD& field) const;

    Json Value(FIELD const& field) const;
    Json Value(FIELD const& field, int pos) const;

    // In one table; what was taken of it stays when something was not.
    void Write(SETMULTIPAR_LIST& list) const;

    // pos: -1 the key.
    void Delete(FIELD const& field, int pos) const;

    std::string Name() const;  // "ticket 3/1"

    PARAM_TYPE TypeAt(std::string const& key, int pos) const;  // PARAM_NONE: nothing is there

private:
    int Count(std::string const& key) const;  // gaps included
    Json Element(std::string const& key, int pos) const;
    template <typename T>
    Json Elements(FIELD const& field) const;
    template <typename T>
    Json Number(std::string const& key, PARAM_TYPE type, int pos) const;

    ComGUIManager& m_manager;
    MTICKET_ACCESS const* m_container;
    int m_type;
    int m_id;
    STICKET_ACCESS const* m_ticket;
};
