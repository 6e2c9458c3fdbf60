// The objects behind a CFArrayRef. The array owns them, and never changes.
#pragma once

#include "standin/corefoundation/CountedObject.h"
#include <CoreFoundation/CoreFoundation.h>
#include <utility>
#include <vector>

struct __CFArray final : comgui::detail::CountedObject
{
    using ELEMENTS = std::vector<comgui::detail::Owned<comgui::detail::CountedObject const>>;

    explicit __CFArray(ELEMENTS content) : elements(std::move(content)) {}

    ELEMENTS const elements;
};
