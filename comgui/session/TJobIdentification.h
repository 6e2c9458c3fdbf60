// What goes with a job that is sent. It never leaves the process, so it may hold a pointer; the plug-in is
// done with it, and with the text, when SendJob returns.
#pragma once

#include <cstddef>
#include <type_traits>

struct TJobIdentification
{
    unsigned int nSize;  // always 160
    int iJobArg1;        // what the arguments say is between the sender and the server
    unsigned int iJobArg2;
    int iJobArg3;
    char reserved16[128];  // zero
    int iJobArg4;
    int reserved148;        // zero
    char* pszUploadFolder;  // where the job goes, UTF-8; the sender's
};
static_assert(std::is_standard_layout_v<TJobIdentification> && std::is_trivial_v<TJobIdentification>);
static_assert(sizeof(TJobIdentification) == 160);
static_assert(offsetof(TJobIdentification, nSize) == 0);
static_assert(offsetof(TJobIdentification, iJobArg1) == 4);
static_assert(offsetof(TJobIdentification, iJobArg2) == 8);
static_assert(offsetof(TJobIdentification, iJobArg3) == 12);
static_assert(offsetof(TJobIdentification, reserved16) == 16);
static_assert(offsetof(TJobIdentification, iJobArg4) == 144);
static_assert(offsetof(TJobIdentification, reserved148) == 148);
static_assert(offsetof(TJobIdentification, pszUploadFolder) == 152);
