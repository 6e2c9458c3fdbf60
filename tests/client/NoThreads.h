// As long as this lives, no thread can begin in this process: there is no room for such a stack.
#pragma once

#include <cstddef>
#include <gtest/gtest.h>
#include <pthread.h>

class NoThreads
{
public:
    NoThreads()
    {
        pthread_getattr_default_np(&m_before);
        pthread_attr_t attributes;
        pthread_getattr_default_np(&attributes);
        pthread_attr_setstacksize(&attributes, std::size_t{1} << 50);
        EXPECT_EQ(pthread_setattr_default_np(&attributes), 0);
        pthread_attr_destroy(&attributes);
    }
    ~NoThreads()
    {
        pthread_setattr_default_np(&m_before);
        pthread_attr_destroy(&m_before);
    }
    NoThreads(NoThreads const&) = delete;
    NoThreads& operator=(NoThreads const&) = delete;

private:
    pthread_attr_t m_before{};
};
