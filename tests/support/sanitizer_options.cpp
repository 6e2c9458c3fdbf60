// A sanitizer ends the program that asks for more memory than there can be. The tests that do so want the
// null that they get without one. To be compiled into each such program: the sanitizers look these up by
// name.

extern "C"
{
    __attribute__((visibility("default"))) char const* __asan_default_options();
    __attribute__((visibility("default"))) char const* __tsan_default_options();
}

char const* __asan_default_options() { return "allocator_may_return_null=1"; }
char const* __tsan_default_options() { return "allocator_may_return_null=1"; }
