#include "tools/comgui_validate/Contract.h"

#include <algorithm>
#include <regex>
#include <sstream>

namespace validate
{
namespace
{
constexpr char Page[] =
#include "module-contract.inc"
    ;

std::string WithoutMarks(std::string text)
{
    text.erase(std::remove(text.begin(), text.end(), '`'), text.end());
    return text;
}

std::vector<std::string> NamesIn(std::string const& cell)
{
    static std::regex const name("`([^`]+)`");
    std::vector<std::string> names;
    for (auto found = std::sregex_iterator(cell.begin(), cell.end(), name); found != std::sregex_iterator();
         ++found)
        names.push_back((*found)[1]);
    return names;
}
}  // namespace

std::vector<Rule> const& Rules()
{
    static std::vector<Rule> const rules = []
    {
        std::regex const row(R"(\| ([A-Z][0-9]+) \| (.*) \| (.*) \|)");
        std::vector<Rule> all;
        std::istringstream page(Page);
        std::smatch cells;
        for (std::string line; std::getline(page, line);)
            if (std::regex_match(line, cells, row))
                all.push_back({cells[1], WithoutMarks(cells[2]), NamesIn(cells[3])});
        return all;
    }();
    return rules;
}

std::string TextOf(std::string const& rule)
{
    auto const found =
        std::find_if(Rules().begin(), Rules().end(), [&rule](Rule const& each) { return each.name == rule; });
    return found == Rules().end() ? "" : found->text;
}
}  // namespace validate
