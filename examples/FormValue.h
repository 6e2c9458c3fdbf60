// Values of tickets as a person writes them on a command line: their types, what each type takes, and lists.
#pragma once

#include <comgui/comgui.h>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

// What was asked for cannot be: no such ticket or key, a value that does not fit, a write that was refused.
struct Refusal : std::runtime_error
{
    using std::runtime_error::runtime_error;
};

// As Shown has it, in quotes.
std::string Quoted(std::string const& text);

// "int", "double", "text" and so on; of types that cannot be written here, too.
char const* NameOf(int type);

// The type of that name; throws a Refusal that tells the names.
PARAM_TYPE TypeOf(std::string const& name);

// What values the type takes, as the end of a sentence that begins with the value.
std::string WhatItTakes(PARAM_TYPE type);

// Adds the value of a key; throws a Refusal if the text is none of the type.
void AddValue(SETMULTIPAR_LIST& list, std::string const& key, PARAM_TYPE type, std::string const& text,
              int pos);

// Key and value; throws a Refusal if there is no = or no key.
std::pair<std::string, std::string> SplitField(std::string const& field);

// The values between the commas. Quotes around a value keep its commas; a quote within them is written twice.
// The empty text is the list without values. Throws a Refusal, which names the key, for a quote that stands
// anywhere else or has no end.
std::vector<std::string> SplitList(std::string const& key, std::string const& text);
