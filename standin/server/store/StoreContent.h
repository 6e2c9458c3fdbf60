// What a new site begins with.
#pragma once

#include "standin/server/store/Store.h"
#include <vector>

namespace standin
{
struct StoreContent
{
    std::vector<TicketChange> tickets;  // creations, each with an address
    std::vector<User> users;
};
}  // namespace standin
