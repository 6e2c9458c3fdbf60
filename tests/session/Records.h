// Login records to be compared as a whole: what an operation does not name must be as it was.
#pragma once

#include "comgui/session/TLogin.h"
#include <cstring>
#include <gmock/gmock.h>
#include <string>

// Every byte of it is the given letter, reserved ranges included, but for the texts' last zero and nSize.
inline TLogin RecordFullOf(char letter)
{
    TLogin login;
    std::memset(&login, letter, sizeof login);
    login.nSize = sizeof login;
    for (auto* const text : {&login.szUser, &login.szPassword, &login.szLocalAddress, &login.szLocalEndPoint,
                             &login.szServerHost})
        (*text)[sizeof *text - 1] = '\0';
    return login;
}

MATCHER_P(IsRecord, expected, "is that record, byte for byte")
{
    auto const* const left = reinterpret_cast<unsigned char const*>(&arg);
    auto const* const right = reinterpret_cast<unsigned char const*>(&expected);
    for (std::size_t i = 0; i < sizeof(TLogin); ++i)
        if (left[i] != right[i])
        {
            *result_listener << "which differs from offset " << i << " on";
            return false;
        }
    return true;
}
