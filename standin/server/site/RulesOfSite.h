// The rules of trouble as a site has them, for whoever sets them beside its programs: the owner and tests.
#pragma once

#include "standin/server/store/Store.h"
#include <functional>
#include <string>
#include <vector>

namespace standin
{
// One a line, as they were put there. Throws StoreError.
std::vector<std::string> RulesOf(Store& store);

// Puts what change leaves of the rules that there are; it is called again if others were faster. Every
// program of the site follows them as soon as it hears of it. Throws StoreError; what change throws passes
// through.
void ChangeRules(Store& store, std::function<void(std::vector<std::string>& rules)> const& change);
}  // namespace standin
