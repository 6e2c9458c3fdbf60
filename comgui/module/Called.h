// What every object has whose functions a host calls: a place for what all its calls have in common, and one
// for exceptions that are about to leave it.
#pragma once

namespace comgui::plugin
{
// A call of a host's that is about to run.
class Call
{
public:
    template <typename Work>
    explicit Call(Work const& work)
        : m_work(&work), m_run([](void const* place) { return (*static_cast<Work const*>(place))(); })
    {
    }

    // Whether it succeeded. Lets no exception out.
    bool operator()() const { return m_run(m_work); }

private:
    void const* m_work;
    bool (*m_run)(void const*);
};

class Called
{
public:
    Called() = default;
    Called(Called const&) = delete;
    Called& operator=(Called const&) = delete;
    virtual ~Called() = default;

    // Runs the call, once or not at all: a call that does not run has failed. Every call passes here but
    // reads of values, which have to be fast. The thread cannot be cancelled meanwhile.
    virtual void Around(Call const& call) { call(); }

    // An exception, other than Refused, has left a function of this object. reason: its text, empty for what
    // is no std::exception. Writes one line to stderr, unless overridden.
    virtual void OnException(char const* reason) noexcept;
};
}  // namespace comgui::plugin
