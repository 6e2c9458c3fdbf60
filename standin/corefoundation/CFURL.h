// The place in the file system behind a CFURLRef: always a full path.
#pragma once

#include "standin/corefoundation/CountedObject.h"
#include <CoreFoundation/CoreFoundation.h>
#include <filesystem>
#include <utility>

struct __CFURL final : comgui::detail::CountedObject
{
    explicit __CFURL(std::filesystem::path place) : path(std::move(place)) {}

    std::filesystem::path const path;
};
