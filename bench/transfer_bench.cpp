// What a file costs on its way through the library and the stand-in server, beside cp of the same file to
// the same disk. cp is another process, so the time that passes counts. Both wait for the disk in the end: a
// file that is carried is on the disk before it gets its name, so the copy of cp is flushed, too. Let them
// take turns, so that a busy disk is busy for both: --benchmark_repetitions=5
// --benchmark_enable_random_interleaving=true.
#include "bench/ratio_report.h"

#include <comgui/comgui.h>

#include <algorithm>
#include <benchmark/benchmark.h>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <fcntl.h>
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

void Flush(std::string const& file)
{
    int const descriptor = open(file.c_str(), O_RDONLY | O_CLOEXEC);
    if (descriptor < 0 || fsync(descriptor) != 0 || close(descriptor) != 0)
        Fail("the copy of cp cannot be flushed");
}

void CopyByCpAndFlush(std::string source, std::string const& to)
{
    std::string program = "cp";
    std::string target = to;
    char* const arguments[] = {program.data(), source.data(), target.data(), nullptr};
    pid_t child = 0;
    int status = 0;
    if (posix_spawnp(&child, "cp", nullptr, nullptr, arguments, environ) != 0 ||
        waitpid(child, &status, 0) != child || status != 0)
        Fail("cp has failed");
    Flush(to);
}

void LogIn()
{
    ComGUIManager& manager = *ComGUIManager::GetInstance();
    if (!hSTicketInstance || manager.Initialize("admin", "admin", "localhost", 50000) != 0 ||
        manager.Login("admin", "admin", "localhost", 50000) != 0)
        Fail("cannot log in to the stand-in server");
}

// The folder of a run, with the source and the site. On a disk: /tmp may be memory.
class PLACE
{
public:
    PLACE() : folder(fs::current_path() / ("transfer_bench-" + std::to_string(getpid())))
    {
        fs::create_directory(folder);
        setenv("COMGUI_SITE", (folder / "site").c_str(), 1);
    }
    ~PLACE()
    {
        std::error_code ignored;
        fs::remove_all(folder, ignored);
    }
    PLACE(PLACE const&) = delete;
    PLACE& operator=(PLACE const&) = delete;

    std::string Source() const { return folder / "source"; }
    std::string Target() const { return folder / "site" / "temp" / "target"; }

private:
    fs::path folder;
};

void CopyByPut(std::string from, std::string const&)
{
    char target[] = "$(TEMP)/target";
    if (ComGUIManager::GetInstance()->PutFileSync(from.data(), target) != 0)
        Fail("PutFileSync has failed");
}

using COPY = void (*)(std::string source, std::string const& target);

// The measured time is that of the copy alone, each into a new file and with nothing left to write.
void Measure(benchmark::State& state, PLACE const& place, COPY copy)
{
    for (auto _ : state)
    {
        fs::remove(place.Target());
        ::sync();
        auto const begin = std::chrono::steady_clock::now();
        copy(place.Source(), place.Target());
        auto const end = std::chrono::steady_clock::now();
        state.SetIterationTime(std::chrono::duration<double>(end - begin).count());
        if (fs::file_size(place.Target()) != fs::file_size(place.Source()))
            return state.SkipWithError("the file has not arrived");
    }
    state.SetBytesProcessed(state.iterations() * static_cast<std::int64_t>(fs::file_size(place.Source())));
}
}  // namespace

int main(int argc, char** argv)
try
{
    constexpr std::size_t MiB = 1024;
    static PLACE const place;        // goes when the plug-in has left its site
    WriteFile(place.Source(), MiB);  // which brings it into memory, too
    LogIn();
    auto const add = [](char const* name, COPY copy)
    {
        benchmark::RegisterBenchmark(name, Measure, std::cref(place), copy)
            ->Iterations(1)
            ->UseManualTime()
            ->Unit(benchmark::kMillisecond);
    };
    add("PutFileSync/1GiB", CopyByPut);
    add("cp and fsync/1GiB", CopyByCpAndFlush);
    int const result =
        RunAndReport(argc, argv,
                     {{"put, 1 GiB", "PutFileSync/1GiB/iterations:1/manual_time",
                       "cp and fsync/1GiB/iterations:1/manual_time", 1.5, GOAL::ELAPSED_TIME}});
    ComGUIManager::GetInstance()->Logout();
    return result;
}
catch (std::exception const& error)
{
    std::fprintf(stderr, "transfer_bench: %s\n", error.what());
    return 1;
}
