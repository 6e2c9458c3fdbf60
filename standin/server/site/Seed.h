// What a new site begins with, read from an XML file: <site version="1"> with <users>, each a name, a role,
// the id of the user's own ticket of type 17 and a password hash, and with <ticket>s as in ticket files.
#pragma once

#include "standin/server/store/StoreContent.h"
#include "standin/server/tickets/TicketXml.h"
#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace standin
{
struct Seed
{
    std::vector<User> users;
    std::vector<TicketXml> tickets;  // each with an address

    // Throws FileError for a file that cannot be read, XmlError for what stands in it.
    static Seed Read(std::filesystem::path const& file);
    static Seed Parse(std::string_view text, std::string const& name);

    StoreContent Content() const;
};
}  // namespace standin
