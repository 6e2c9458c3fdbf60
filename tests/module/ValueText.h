// Values as texts, for tests that write down what passes.
#pragma once

#include "comgui/ticket/PARAM_TYPE.h"
#include <string>

// Of the value word of a write: 7, 1.500000, -5ll, 6u, 8ull, ->address, 'text', [bytes], none for a deletion.
std::string TextOf(PARAM_TYPE type, void const* word);
