// The program's own calloc, from which the library takes the tables of lists: it counts, and one call fails
// that a test has chosen. Of this thread alone.
#pragma once

// Counts from its making on.
class CountedCallocs
{
public:
    CountedCallocs();
    int Count() const;

private:
    int m_before;
};

// While it lives the nth calloc from its making on gives null, 0 being the next.
class FailingCalloc
{
public:
    explicit FailingCalloc(int n);
    ~FailingCalloc();
    FailingCalloc(FailingCalloc const&) = delete;
    FailingCalloc& operator=(FailingCalloc const&) = delete;
};
