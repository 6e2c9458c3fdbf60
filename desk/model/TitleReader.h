// The names of the tickets that somebody sees, read on the worker's thread.
#pragma once

#include "desk/model/TitleCache.h"
#include <comgui/client.h>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace desk
{
// For the thread of the worker's results.
class TitleReader
{
public:
    // The worker outlives the reader.
    TitleReader(comgui::Tickets const& tickets, comgui::Worker const& worker);

    std::function<void()> onTitles = [] {};  // some are there that were not before

    // For painting: empty as long as it is not known.
    std::string TitleOf(comgui::TicketAddress ticket);
    std::function<void()> onAsked = [] {};  // a title is wanted: call Read() soon, once for all

    // Reads what was asked for since the last time, and nothing that is out of sight by now.
    void Read();

    void Take(comgui::Event const& event);  // a title may have changed
    void Clear();                           // another session

private:
    void TakeChanged(comgui::TicketAddress ticket);

    comgui::Tickets const m_tickets;
    comgui::Worker const& m_worker;
    TitleCache m_cache;
    std::vector<comgui::TicketAddress> m_asked;  // since then
    bool m_isReading = false;
    std::shared_ptr<bool> m_alive = std::make_shared<bool>(true);
};
}  // namespace desk
