// While it lives, operator new throws std::bad_alloc on this thread once it has succeeded so many times.
#pragma once

class ScarceMemory
{
public:
    explicit ScarceMemory(int allocations);
    ~ScarceMemory();
    ScarceMemory(ScarceMemory const&) = delete;
    ScarceMemory& operator=(ScarceMemory const&) = delete;
};
