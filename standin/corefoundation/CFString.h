// The text behind a CFStringRef: valid UTF-8 without a zero byte, never changed.
#pragma once

#include "standin/corefoundation/CountedObject.h"
#include <CoreFoundation/CoreFoundation.h>
#include <string>
#include <utility>

struct __CFString final : comgui::detail::CountedObject
{
    explicit __CFString(std::string content) : text(std::move(content)) {}

    std::string const text;
};
