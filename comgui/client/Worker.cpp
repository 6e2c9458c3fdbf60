#include "comgui/client/Worker.h"

#include <atomic>

namespace comgui
{
struct Worker::STATE
{
    TaskQueue queue;
    std::atomic<bool> isOver{false};
};

// The results know the state only as long as it lives: the work in its queue holds them.
Worker::Worker(Executor results)
    : m_state(std::make_shared<STATE>()),
      m_results(
          [weak = std::weak_ptr<STATE>(m_state), results = std::move(results)](std::function<void()> task)
          {
              results(
                  [weak, task = std::move(task)]
                  {
                      auto const state = weak.lock();
                      if (state && !state->isOver)
                          task();
                  });
          }),
      m_work(m_state->queue.GetExecutor()), m_thread([state = m_state] { state->queue.Run(); })
{
}

Worker::~Worker()
{
    m_state->isOver = true;
    m_state->queue.Stop();
    m_thread.join();
}
}  // namespace comgui
