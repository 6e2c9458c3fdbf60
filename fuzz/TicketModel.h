// A second telling of what a write does to a ticket, as plain as it can be: a map of maps. With the values
// that the module's slots are given, and what its slots hand out, taken apart with all that a caller may rely
// on.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include "fuzz/fuzz.h"
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <utility>
#include <vector>

// A value as it is stored: its type, and its bytes or those of its number.
using MODEL_VALUE = std::pair<PARAM_TYPE, std::string>;

// By key and position.
using MODEL_TICKET = std::map<std::string, std::map<int, MODEL_VALUE>>;

// A value as a slot is given it, good or bad.
class VALUE
{
public:
    explicit VALUE(INPUT& input);
    VALUE(VALUE const&) = delete;
    VALUE& operator=(VALUE const&) = delete;

    PARAM_TYPE Type() const { return m_type; }
    void const* Word() const;
    bool CanBeWritten() const;  // as far as the value goes
    MODEL_VALUE Stored() const;

private:
    PARAM_TYPE m_type;
    bool m_isNull;
    std::string m_text;
    BIN_STRING m_binary;
    std::uint64_t m_number;
};

// Whether a write can be carried out at all.
bool CanBeWritten(char const* key, VALUE const& value, int pos);

// Carries out one that can be.
void Write(MODEL_TICKET& ticket, std::string const& key, VALUE const& value, int pos);

// Texts that were handed out, with what stood there.
class TEXTS
{
public:
    void Remember(void const* text, std::size_t size);
    void MustStand() const;  // as they did
    bool IsEmpty() const { return m_texts.empty(); }

private:
    std::vector<std::pair<char const*, std::string>> m_texts;
};

// What stands in the ticket, by a walk over it, which must go in order. texts: may be null.
MODEL_TICKET Walked(STICKET_ACCESS const& ticket, TEXTS* texts);

// Reads by the slot, which gets the place for the value; that must be untouched where the value does not
// stand. texts: null if nothing that is handed out may be looked at any more.
std::optional<std::string> Read(std::function<int(void* out)> const& slot, PARAM_TYPE type, TEXTS* texts);

// What a read gives, by the model.
std::optional<std::string> Read(MODEL_TICKET const& ticket, char const* key, PARAM_TYPE type, int pos);
