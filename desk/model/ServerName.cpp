#include "desk/model/ServerName.h"

#include <algorithm>
#include <charconv>

namespace desk
{
namespace
{
constexpr std::string_view Spaces = " \t\r\n";

std::string_view Trimmed(std::string_view text)
{
    auto const begin = text.find_first_not_of(Spaces);
    return begin == text.npos ? std::string_view()
                              : text.substr(begin, text.find_last_not_of(Spaces) - begin + 1);
}

std::optional<int> PortFromText(std::string_view text)
{
    int port = 0;
    auto const [end, error] = std::from_chars(text.data(), text.data() + text.size(), port);
    bool const isWhole = error == std::errc() && end == text.data() + text.size();
    return isWhole && port >= 1 && port <= 65535 ? std::optional(port) : std::nullopt;
}
}  // namespace

std::optional<comgui::Server> ServerFromText(std::string_view text)
{
    text = Trimmed(text);
    comgui::Server server;
    // Colons are also within addresses; those stand in brackets, or alone without a port.
    auto const bracket = text.starts_with('[') ? text.find(']') : text.npos;
    auto const colon = text.rfind(':');
    bool const isAddress = bracket == text.npos && colon != text.find(':');
    std::string_view rest;
    if (bracket != text.npos)
    {
        server.host = text.substr(1, bracket - 1);
        rest = text.substr(bracket + 1);
    }
    else if (isAddress || colon == text.npos)
        server.host = text;
    else
    {
        server.host = text.substr(0, colon);
        rest = text.substr(colon);
    }
    if (server.host.empty() || server.host.find_first_of(std::string(Spaces) + "[]") != std::string::npos)
        return std::nullopt;
    if (rest.empty())
        return server;
    auto const port = rest[0] == ':' ? PortFromText(rest.substr(1)) : std::nullopt;
    if (!port)
        return std::nullopt;
    server.port = *port;
    return server;
}

std::string TextOf(comgui::Server const& server)
{
    if (server.port == comgui::Server().port)
        return server.host;
    bool const isAddress = server.host.find(':') != std::string::npos;
    return (isAddress ? "[" + server.host + "]" : server.host) + ":" + std::to_string(server.port);
}

void Remember(std::vector<std::string>& servers, std::string const& server)
{
    constexpr std::size_t Most = 10;
    std::erase(servers, server);
    servers.insert(servers.begin(), server);
    servers.resize(std::min(servers.size(), Most));
}
}  // namespace desk
