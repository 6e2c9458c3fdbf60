// Whether this program is built with a sanitizer, under which all takes longer and faults end otherwise.
#pragma once

#if defined(__SANITIZE_ADDRESS__) || defined(__SANITIZE_THREAD__)
#    define COMGUI_SANITIZED 1
#elif defined(__has_feature)
#    define COMGUI_SANITIZED (__has_feature(address_sanitizer) || __has_feature(thread_sanitizer))
#else
#    define COMGUI_SANITIZED 0
#endif

inline constexpr bool IsSanitized = COMGUI_SANITIZED;
