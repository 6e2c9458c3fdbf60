// A value of a ticket, of any of the types that can be stored, and how it goes through a slot.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <array>
#include <optional>
#include <string>
#include <vector>

namespace validate
{
struct Value
{
    PARAM_TYPE type = PARAM_NONE;
    std::string bytes;  // of a number or pointer as the machine has it, else the text or the bytes themselves

    friend bool operator==(Value const&, Value const&) = default;
};

Value Pointer(void* pointer);
Value Int(int number);
Value Double(double number);
Value Text(std::string text);
Value Bytes(std::string bytes);
Value Int64(long long number);
Value Unsigned(unsigned int number);
Value Unsigned64(unsigned long long number);

// One of each type, each different from its type's zero. Pointers last.
std::vector<Value> const& OneOfEachType();

std::string NameOf(PARAM_TYPE type);    // "PARAM_INT"
std::string Shown(Value const& value);  // for people, on one line, cut if it is long
std::string Shown(std::optional<Value> const& value);

// What a write slot gets. Lives as long as its value stays where it is.
class WrittenWord
{
public:
    explicit WrittenWord(Value const& value);
    void const* Get() const { return m_word; }

private:
    BIN_STRING m_bytes;
    void const* m_word;
};

// The place that a read slot fills, with a pattern all around.
class ReadPlace
{
public:
    ReadPlace();
    void* Get() { return m_bytes.data(); }

    bool IsUntouched() const;
    bool IsUntouchedBehind(PARAM_TYPE type) const;  // the width of that type

    // What stands there, as a slot that succeeded has left it; none if it is a text or bytes at null.
    std::optional<Value> As(PARAM_TYPE type) const;

private:
    alignas(16) std::array<unsigned char, 64> m_bytes;
};

// The value of a record or a walk, whose word is as on a write; none at null where there must be an address.
std::optional<Value> ValueOfWord(PARAM_TYPE type, void const* word);
}  // namespace validate
