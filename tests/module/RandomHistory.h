// Draws a history for the module and its model: the same for the same seed, everywhere.
#pragma once

#include "tests/module/ModelStep.h"

// Begins with a login of each session.
std::vector<STEP> RandomHistory(unsigned seed, std::size_t steps);
