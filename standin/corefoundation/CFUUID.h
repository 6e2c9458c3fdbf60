// The UUID behind a CFUUIDRef.
#pragma once

#include "standin/corefoundation/CountedObject.h"
#include "standin/corefoundation/Uuid.h"

struct __CFUUID final : comgui::detail::CountedObject
{
    explicit __CFUUID(comgui::detail::Uuid const& value) : bytes(value) {}

    comgui::detail::Uuid const bytes;
};
