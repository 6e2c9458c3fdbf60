// One of the programs that soak starts beside the writers. It works until its standard input ends or has a
// line, then it leaves the site and ends with 0. It writes lines to its standard output:
//     ready                    it is logged in
//     did N                    ten times a second at most: what it has done since the last such line
//     saved N | found N        of the editor of ticket files: what is on the disk
//     bye                      it ends
//     torn WHAT | misheard WHAT | lost WHAT | refused WHAT    what must not be
#pragma once

#include <filesystem>
#include <string>
#include <vector>

struct SoakTask
{
    std::string kind;  // one of SoakKinds()
    int number = 0;    // of this program, among those of its kind
    int lanes = 0;     // of the writers
    unsigned seed = 0;
    bool isFirst = false;          // it was there before the writers
    std::filesystem::path folder;  // for files of its own
};

std::vector<std::string> SoakKinds();

// The exit code of the program.
int RunSoakClient(SoakTask const& task);
