// A ticket of the plug-in's factory.
#pragma once

#include "tools/comgui_validate/Trial.h"
#include "tools/shared/text.h"
#include <optional>
#include <string>

namespace validate
{
inline STicketFactory const& FactoryOf(Trial& trial)
{
    auto const* const factory = trial.GetModule().table.STicketFactory;
    if (!factory || !factory->CreateTicket || !factory->DestroyTicket)
        throw Skipped("there is no ticket factory; see memory.factory");
    return *factory;
}

// In memory, or of a file, for as long as it lives. Skipped, if there is none.
class MemoryTicket
{
public:
    explicit MemoryTicket(Trial& trial, std::optional<std::string> const& path = std::nullopt)
        : m_trial(trial), m_factory(FactoryOf(trial))
    {
        trial.Calling(path ? "CreateTicket(" + tools::Shown(*path) + ")" : "CreateTicket(null)");
        m_table = m_factory.CreateTicket(path ? path->c_str() : nullptr);
        if (!m_table)
            throw Skipped("the ticket factory gives no ticket; see memory.empty and files.open");
    }
    ~MemoryTicket() { Destroy(); }
    MemoryTicket(MemoryTicket const&) = delete;
    MemoryTicket& operator=(MemoryTicket const&) = delete;

    STICKET_ACCESS const* Table() const { return m_table; }

    void Destroy()
    {
        if (!m_table)
            return;
        m_trial.Calling("DestroyTicket(&ticket)");
        m_factory.DestroyTicket(&m_table);
        m_table = nullptr;
    }

private:
    Trial& m_trial;
    STicketFactory const& m_factory;
    STICKET_ACCESS const* m_table = nullptr;
};
}  // namespace validate
