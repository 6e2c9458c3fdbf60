// Ctrl-C and its kin as a request that a command looks for, so that it can put a terminal, a file and the
// site in order before it ends. The second signal of a kind ends the process at once. For the whole process.
#pragma once

namespace comgui_site
{
class Interrupts
{
public:
    // From now on SIGINT, SIGTERM, SIGHUP and SIGQUIT are requests, unless whoever started the program has
    // them ignored; a closed pipe and a full disk are errors of the write and no signals.
    static void Watch();

    static bool HaveCome() noexcept;
    static void Check();             // throws Interrupted if one has come
    static int Descriptor();         // can be read as soon as one has come; -1 before Watch
    [[noreturn]] static void End();  // by the signal that came, so that a shell sees it
};
}  // namespace comgui_site
