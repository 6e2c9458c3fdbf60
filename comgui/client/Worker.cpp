#include "comgui/client/Worker.h"

namespace comgui
{
struct Worker::STATE
{
    TaskQueue queue;
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
                      if (auto const state = weak.lock())
                          task();
                  });
          }),
      m_work(m_state->queue.GetExecutor()), m_thread([state = m_state] { state->queue.Run(); })
{
}

Worker::~Worker()
{
    m_state->queue.Stop();
    m_thread.join();
}
}  // namespace comgui
