#include "comgui/client/Worker.h"

#include <atomic>

namespace comgui
{
struct Worker::STATE
{
    TaskQueue queue;
    std::atomic<bool> isOver{false};
};

Worker::Worker(Executor results)
    : m_state(std::make_shared<STATE>()),
      m_results([state = m_state, results = std::move(results)](std::function<void()> task)
                { results([state, task = std::move(task)] { state->isOver ? void() : task(); }); }),
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
