// The rules of docs/module-contract.md, which is compiled in, so that page and program cannot differ.
#pragma once

#include <string>
#include <vector>

namespace validate
{
struct Rule
{
    std::string name;  // "V6"
    std::string text;
    std::vector<std::string> checks;
};

// In the order of the page.
std::vector<Rule> const& Rules();

// Empty if there is no such rule.
std::string TextOf(std::string const& rule);
}  // namespace validate
