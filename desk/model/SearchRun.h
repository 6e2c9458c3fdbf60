// A search that runs on the worker's thread, for a short time at once, so that whatever else the worker has
// to do gets its turn in between.
#pragma once

#include "desk/model/TicketSearch.h"
#include <comgui/client.h>
#include <functional>
#include <memory>

namespace desk
{
class SearchRun
{
public:
    using Handler = std::function<void(SearchBatch const&)>;

    // The handler is called on the thread of the worker's results. The worker outlives the run.
    SearchRun(comgui::Worker const& worker, comgui::Tickets const& tickets, SearchQuery const& query,
              std::vector<comgui::TicketAddress> const& all, Handler handler);
    ~SearchRun();  // no call of the handler comes any more

    // The server is back: goes on if it was interrupted.
    void GoOn();

    SearchRun(SearchRun const&) = delete;
    SearchRun& operator=(SearchRun const&) = delete;

private:
    struct STATE;
    std::shared_ptr<STATE> m_state;
};
}  // namespace desk
