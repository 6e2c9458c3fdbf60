// Which keys of jobs a client hears of.
#pragma once

#include "comgui/client.h"
#include <chrono>
#include <functional>
#include <string>
#include <vector>

// The keys that the connection is told of once the change has been made, as soon as there are any.
inline std::vector<std::string> KeysHeardOf(comgui::Connection& connection,
                                            std::function<void()> const& change)
{
    using namespace std::chrono_literals;
    comgui::TaskQueue queue;
    std::vector<std::string> heard;
    auto const subscription =
        connection.Subscribe(comgui::Interest::InTypes({3}), queue.GetExecutor(),
                             [&](comgui::Event const& event)
                             {
                                 if (auto const* const changed = std::get_if<comgui::TicketChanged>(&event))
                                     for (comgui::KeyChange const& key : changed->keys)
                                         heard.push_back(key.key);
                             });
    change();
    for (auto const end = std::chrono::steady_clock::now() + 20s;
         heard.empty() && std::chrono::steady_clock::now() < end;)
        queue.RunFor(5ms);
    return heard;
}
