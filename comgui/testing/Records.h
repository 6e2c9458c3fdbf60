// What tables of records hold, as plain values that compare and print, so that a test says what it expects of
// a table in one line:
//
//     EXPECT_THAT(RecordsOf(table), ElementsAre(Parameter{"Job/Copies", 3, -1}));
//
// Tables end at a null key; a null table has no records. Values are copied: nothing dies with the table.
#pragma once

#include "comgui/module/Value.h"
#include "comgui/ticket/SETMULTIPAR.h"
#include "comgui/ticket/STICKET_ACCESS.h"
#include <ostream>
#include <string>
#include <vector>

namespace comgui::plugin
{
inline bool operator==(Parameter const& left, Parameter const& right)
{
    return left.key == right.key && left.pos == right.pos && left.value == right.value;
}

// For GoogleTest: "Job/Copies[-1]=int 3".
void PrintTo(Parameter const& parameter, std::ostream* out);
}  // namespace comgui::plugin

namespace comgui::test
{
using plugin::Parameter;
using plugin::Value;

// Of a write, or of a notification.
std::vector<Parameter> RecordsOf(SETMULTIPAR const* table);

// Of a read, as far as its records are ok; those that failed have no value, nor have those that asked for a
// type or a count.
std::vector<Parameter> RecordsOf(GETMULTIPAR const* table);

// Everything in a ticket, by walking over it.
std::vector<Parameter> RecordsOf(STICKET_ACCESS const* ticket);

// "int 3", "text 'draft'", "bytes 00FF", "none" and so on.
std::string TextOf(Value const& value);
}  // namespace comgui::test
