// What a file costs on its way through the library and the stand-in server, beside cp of the same file to
// the same disk. The two take turns, so that a busy disk is busy for both, and the middle of the rounds
// counts. Neither waits for the disk in the end.
//
//     transfer_bench [MiB [rounds]]     1024 MiB and 5 rounds unless told
#include <comgui/comgui.h>

#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <random>
#include <spawn.h>
#include <stdexcept>
#include <string>
#include <sys/wait.h>
#include <unistd.h>
#include <vector>

namespace
{
namespace fs = std::filesystem;

[[noreturn]] void Fail(char const* reason) { throw std::runtime_error(reason); }

void WriteFile(fs::path const& file, std::size_t mebibytes)
{
    constexpr std::size_t BlockSize = std::size_t{1024} * 1024;
    std::mt19937_64 random{std::random_device()()};
    std::vector<std::uint64_t> block(BlockSize / sizeof(std::uint64_t));
    std::generate(block.begin(), block.end(), random);
    std::ofstream stream(file, std::ios::binary);
    for (std::size_t i = 0; i < mebibytes; ++i)
    {
        block[0] = i;  // lest a file system find out that all blocks are one
        stream.write(reinterpret_cast<char const*>(block.data()), BlockSize);
    }
    if (!stream.flush())
        Fail("the file to be sent cannot be written");
}

template <typename Work>
double SecondsOf(Work const& work)
{
    auto const begin = std::chrono::steady_clock::now();
    work();
    return std::chrono::duration<double>(std::chrono::steady_clock::now() - begin).count();
}

void CopyByCp(std::string const& from, std::string const& to)
{
    std::string program = "cp";
    std::string source = from;
    std::string target = to;
    char* const arguments[] = {program.data(), source.data(), target.data(), nullptr};
    pid_t child = 0;
    int status = 0;
    if (posix_spawnp(&child, "cp", nullptr, nullptr, arguments, environ) != 0 ||
        waitpid(child, &status, 0) != child || status != 0)
        Fail("cp has failed");
}

double MedianOf(std::vector<double> seconds)
{
    std::sort(seconds.begin(), seconds.end());
    return seconds[seconds.size() / 2];
}

void LogIn()
{
    ComGUIManager& manager = *ComGUIManager::GetInstance();
    if (!hSTicketInstance || manager.Initialize("admin", "admin", "localhost", 50000) != 0 ||
        manager.Login("admin", "admin", "localhost", 50000) != 0)
        Fail("cannot log in to the stand-in server");
}

void Put(std::string from)
{
    char target[] = "$(TEMP)/put";
    if (ComGUIManager::GetInstance()->PutFileSync(from.data(), target) != 0)
        Fail("PutFileSync has failed");
}

void Measure(fs::path const& folder, std::size_t mebibytes, int rounds)
{
    std::string const source = folder / "source";
    fs::path const temp = folder / "site" / "temp";
    WriteFile(source, mebibytes);
    LogIn();
    std::vector<double> cp;
    std::vector<double> put;
    for (int round = 0; round <= rounds; ++round)
    {
        fs::remove(temp / "copied");
        fs::remove(temp / "put");
        ::sync();  // what earlier rounds left to write
        double const byCp = SecondsOf([&] { CopyByCp(source, temp / "copied"); });
        ::sync();
        double const byPut = SecondsOf([&] { Put(source); });
        if (fs::file_size(temp / "put") != fs::file_size(source))
            Fail("the file has not arrived");
        if (round == 0)
            continue;  // the source had to come into memory first
        cp.push_back(byCp);
        put.push_back(byPut);
    }
    auto const rate = [&](double seconds) { return static_cast<double>(mebibytes) / seconds; };
    double const ratio = MedianOf(put) / MedianOf(cp);
    std::printf("| %zu MiB | seconds | MiB/s |\n|---|---|---|\n", mebibytes);
    std::printf("| cp | %.3f | %.0f |\n", MedianOf(cp), rate(MedianOf(cp)));
    std::printf("| PutFileSync | %.3f | %.0f |\n", MedianOf(put), rate(MedianOf(put)));
    std::printf("\nPutFileSync by cp: %.2f (goal: 1.5 at most%s)\n", ratio, ratio <= 1.5 ? "" : ", NOT MET");
}
}  // namespace

int main(int argc, char** argv)
{
    std::size_t const mebibytes = argc > 1 ? std::strtoul(argv[1], nullptr, 10) : 1024;
    int const rounds = argc > 2 ? static_cast<int>(std::strtol(argv[2], nullptr, 10)) : 5;
    if (mebibytes == 0 || rounds < 1)
        return std::fputs("usage: transfer_bench [MiB [rounds]]\n", stderr), 1;
    // On a disk, beside which /tmp may be memory.
    fs::path const folder = fs::current_path() / ("transfer_bench-" + std::to_string(getpid()));
    fs::create_directory(folder);
    setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
    int result = 0;
    try
    {
        Measure(folder, mebibytes, rounds);
        ComGUIManager::GetInstance()->Logout();
    }
    catch (std::exception const& error)
    {
        std::fprintf(stderr, "transfer_bench: %s\n", error.what());
        result = 1;
    }
    fs::remove_all(folder);
    return result;
}
