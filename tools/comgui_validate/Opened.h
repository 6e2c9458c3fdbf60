// A ticket of a container through a table of its own.
#pragma once

#include "tools/comgui_validate/Session.h"

namespace validate
{
// Opened for as long as it lives. Skipped, if that fails: tickets.open looks into it.
class Opened
{
public:
    Opened(Session& session, int type, int id) : m_container(session.Container()), m_type(type), m_id(id)
    {
        session.GetTrial().Calling("MOPERATION(" + NameOf(type, id) + ", MTICKET_OP_OPEN, &ticket)");
        if (m_container->MOPERATION(m_container->Instance, type, id, MTICKET_OP_OPEN, &m_table) == 0 ||
            !m_table)
            throw Skipped("the ticket cannot be opened; see tickets.open");
    }
    ~Opened()
    {
        bool flag = false;
        m_container->MOPERATION(m_container->Instance, m_type, m_id, MTICKET_OP_CLOSE, &flag);
    }
    Opened(Opened const&) = delete;
    Opened& operator=(Opened const&) = delete;

    STICKET_ACCESS const* Table() const { return m_table; }

private:
    MTICKET_ACCESS const* const m_container;
    int const m_type;
    int const m_id;
    STICKET_ACCESS const* m_table = nullptr;
};
}  // namespace validate
