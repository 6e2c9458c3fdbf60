// A child that was made by fork has none of its parent's threads, and may have locks of theirs which nobody
// releases any more.
#pragma once

namespace standin
{
// Whether this process is such a child, of one that had a site open.
bool IsForkedChild() noexcept;

// Called in the child by the handler of fork.
void NoteForkedChild() noexcept;

// While one lives, a site is open: a child that is made by fork is noted.
class ForkWatch
{
public:
    ForkWatch();
    ~ForkWatch();
    ForkWatch(ForkWatch const&) = delete;
    ForkWatch& operator=(ForkWatch const&) = delete;
};
}  // namespace standin
