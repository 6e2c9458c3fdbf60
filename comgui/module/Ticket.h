// A ticket that is made outside any session, as one object whose values an author reads and writes: in
// memory, or of a file. The kit turns the slots of its table into these calls, checks what comes in, and
// keeps the texts that were read.
#pragma once

#include "comgui/module/Kept.h"
#include "comgui/module/Parameters.h"
#include "comgui/module/TicketSlots.h"
#include "comgui/module/Value.h"
#include <string_view>
#include <vector>

class clFOLDER_VARIABLES;

namespace comgui::plugin
{
class Ticket : public TicketSlots
{
public:
    // The value at that position of the key, from 0; none if there is none. A slot that asks for another type
    // fails.
    virtual Value Read(std::string_view key, int pos) = 0;

    // One more than the largest position that has a value.
    virtual int Count(std::string_view key);

    // pos: -1 the key as a whole, 0 and above one value, -2 behind the last. No value deletes. False if it is
    // not written.
    virtual bool Write(std::string_view key, Value const& value, int pos);

    // Every value whose key begins with the prefix. A walk hands out what was there at its beginning.
    virtual std::vector<Parameter> All(std::string_view prefix);

    // Whose copy this is, for hosts that ask.
    virtual Address WhoAmI() { return {}; }

    // The translator of folder paths, which the author keeps owning; null for none.
    virtual clFOLDER_VARIABLES* Folders() { return nullptr; }

    bool Get(char const* key, PARAM_TYPE type, void* value, int pos) override;
    bool GetTable(GETMULTIPAR* table) override;
    bool Set(char const* key, PARAM_TYPE type, void const* value, int pos) override;
    bool SetTable(SETMULTIPAR* table) override;
    bool Walk(SWALKPARAMETERS_ACTION action, void* context, char const* prefix, int limit) override;
    bool Option(int code, void* out) override;

private:
    KeptValues m_kept;
};

// In memory. An author's ticket of a file may derive from it and fill it when it is made.
class MemoryTicket : public Ticket
{
public:
    Value Read(std::string_view key, int pos) override { return m_parameters.Read(key, pos); }
    int Count(std::string_view key) override { return m_parameters.Count(key); }
    bool Write(std::string_view key, Value const& value, int pos) override
    {
        return m_parameters.Write(key, value, pos);
    }
    std::vector<Parameter> All(std::string_view prefix) override { return m_parameters.All(prefix); }

protected:
    Parameters m_parameters;
};
}  // namespace comgui::plugin
