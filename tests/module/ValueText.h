// Values as texts, for tests that write down what passes.
#pragma once

#include "comgui/ticket/STICKET_ACCESS.h"
#include <string>
#include <vector>

// Of the value word of a write: 7, 1.500000, -5ll, 6u, 8ull, ->address, 'text', [bytes], none for a deletion.
std::string TextOf(PARAM_TYPE type, void const* word);

// Every value of a ticket in the order of a walk, as "KEY@POS=VALUE".
std::vector<std::string> ContentOf(STICKET_ACCESS const* ticket);
