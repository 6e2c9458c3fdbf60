// What goes with a remote command: the plug-in carries it to the server as it is, and back. All of it is
// zero but for what a command uses; the texts are UTF-8 and need no zero byte where they fill their field.
#pragma once

#include <cstddef>
#include <type_traits>

struct TCommandRecord
{
    unsigned int nMagic;  // always 0x49494949, the bytes "IIII"; what ComGUIManager::GetEndian() says
    unsigned int nSize;   // always 540
    int iArgA;            // what the arguments say is between the command's sender and the server
    int iArgB;
    int iArgC;
    int iResult;  // going in: one more argument; coming back: the answer
    char szText1[258];
    char szText2[258];
};
static_assert(std::is_standard_layout_v<TCommandRecord> && std::is_trivial_v<TCommandRecord>);
static_assert(sizeof(TCommandRecord) == 540);
static_assert(offsetof(TCommandRecord, nMagic) == 0);
static_assert(offsetof(TCommandRecord, nSize) == 4);
static_assert(offsetof(TCommandRecord, iArgA) == 8);
static_assert(offsetof(TCommandRecord, iArgB) == 12);
static_assert(offsetof(TCommandRecord, iArgC) == 16);
static_assert(offsetof(TCommandRecord, iResult) == 20);
static_assert(offsetof(TCommandRecord, szText1) == 24);
static_assert(offsetof(TCommandRecord, szText2) == 282);
static_assert(sizeof(TCommandRecord::szText1) == 258 && sizeof(TCommandRecord::szText2) == 258);
