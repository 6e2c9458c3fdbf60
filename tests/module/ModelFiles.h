// The files that random histories send about. "~" stands for the folder of the test.
#pragma once

#include <array>
#include <string>
#include <utility>

// Name and content of the files in "~/local"; beside them there is a folder, "~/local/folder".
inline std::array<std::pair<std::string, std::string>, 3> const& LocalFiles()
{
    static std::array<std::pair<std::string, std::string>, 3> const files{
        {{"small", "%PDF-1.4 content"}, {"empty", ""}, {"large", std::string(100'000, 'x')}}};
    return files;
}

// Where files come to that are fetched; the other path leads nowhere.
inline constexpr char FetchedFile[] = "~/fetched";
inline constexpr char NoSuchFolder[] = "~/nowhere/fetched";

// The ticket files, in the folder itself.
inline constexpr int TicketFiles = 3;
inline std::string TicketFileName(int number) { return "ticket" + std::to_string(number) + ".xml"; }

// A file by its size and its beginning.
inline std::string ContentLine(std::string const& content)
{
    return std::to_string(content.size()) + " bytes " + content.substr(0, 20);
}
