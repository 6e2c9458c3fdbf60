// Removes what is in a folder. It is named by a descriptor, and nothing is followed on the way: who puts a
// link in the place of a folder meanwhile loses the link, and nobody what it leads to.
#pragma once

#include <functional>
#include <string>
#include <vector>

namespace standin
{
// The names of what is in the folder, but for "." and "..", in no order. Fewer, with an errno other than 0,
// if it cannot be read to its end.
std::vector<std::string> NamesIn(int folder);

// last: what goes behind all others, and stays if one of them does. False, and errno tells why of the first,
// if something stays; then all that can go has gone.
bool RemoveContent(int folder, std::function<bool(std::string const& name)> const& last = {});
}  // namespace standin
