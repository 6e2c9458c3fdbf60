#include "desk/model/SearchRun.h"

#include <chrono>
#include <utility>

namespace desk
{
namespace
{
// How long other work may wait for its turn, whatever a ticket takes.
constexpr std::chrono::milliseconds StepTime(50);
constexpr std::size_t TicketsInAStep = 1'000;  // so many finds at once the window takes without a pause
}  // namespace

struct SearchRun::STATE : std::enable_shared_from_this<STATE>
{
    STATE(comgui::Worker const& of, SearchQuery const& query, std::vector<comgui::TicketAddress> const& all,
          SearchReader reader, Handler found)
        : worker(of), search(query, all, std::move(reader)), handler(std::move(found))
    {
    }

    void Go()
    {
        worker.Do([self = shared_from_this()] { return self->search.Step(TicketsInAStep, StepTime); },
                  [weak = weak_from_this(), begunAt = returns](SearchBatch const& batch)
                  {
                      auto const self = weak.lock();
                      if (!self || self->isOver)
                          return;
                      // The server may have come back before the interruption is known here.
                      bool const isCut = batch.state == SearchState::Interrupted;
                      self->isInterrupted = isCut && begunAt == self->returns;
                      if (batch.state == SearchState::Running || (isCut && !self->isInterrupted))
                          self->Go();
                      self->handler(batch);
                  });
    }

    comgui::Worker const& worker;
    TicketSearch search;
    Handler const handler;
    bool isOver = false;
    bool isInterrupted = false;
    unsigned long returns = 0;  // of the server
};

SearchRun::SearchRun(comgui::Worker const& worker, comgui::Tickets const& tickets, SearchQuery const& query,
                     std::vector<comgui::TicketAddress> const& all, Handler handler)
    : m_state(std::make_shared<STATE>(
          worker, query, all,
          [tickets](comgui::TicketAddress ticket)
          { return tickets.ReadAll(ticket, comgui::Paths::AsStored); },
          std::move(handler)))
{
    m_state->Go();
}

void SearchRun::GoOn()
{
    ++m_state->returns;
    if (std::exchange(m_state->isInterrupted, false))
        m_state->Go();
}

SearchRun::~SearchRun()
{
    m_state->isOver = true;
    m_state->search.Cancel();
}
}  // namespace desk
