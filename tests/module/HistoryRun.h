// Carries out a history at the real module, with two programs on a new site, and at the model, and compares
// every answer and every notification.
#pragma once

#include "tests/module/ModelStep.h"

// What differed first, with the steps up to there; empty if nothing did. The programs are copies of this
// process, which must not have opened a site itself; so a history in which one of them dies or comes to no
// end is one more that differs.
std::string DifferenceIn(std::vector<STEP> const& history);
