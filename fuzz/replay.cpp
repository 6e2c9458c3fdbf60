// The main program of a fuzz target where there is no fuzzer: runs the target once for each file that is
// named or lies in a folder that is named. A failing target ends the program. So does a folder or file that
// is not there or is empty of inputs, since a test that runs on nothing would pass for ever.
#include "fuzz/fuzz.h"
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <vector>

namespace
{
std::vector<std::filesystem::path> InputsOf(std::filesystem::path const& argument)
{
    if (!std::filesystem::is_directory(argument))
        return {argument};
    std::vector<std::filesystem::path> files;
    for (auto const& entry : std::filesystem::directory_iterator(argument))
        if (entry.is_regular_file())
            files.push_back(entry.path());
    std::sort(files.begin(), files.end());
    return files;
}

// The bytes lie in a block of exactly their size: a sanitizer sees one byte too far.
bool Run(std::filesystem::path const& file)
{
    std::ifstream stream(file, std::ios::binary);
    std::vector<char> bytes((std::istreambuf_iterator<char>(stream)), std::istreambuf_iterator<char>());
    if (!stream.is_open())
        return false;
    bytes.shrink_to_fit();
    LLVMFuzzerTestOneInput(reinterpret_cast<std::uint8_t const*>(bytes.data()), bytes.size());
    return true;
}
}  // namespace

int main(int count, char** arguments)
{
    std::size_t ran = 0;
    for (int i = 1; i < count; ++i)
    {
        auto const inputs = InputsOf(arguments[i]);
        for (auto const& input : inputs)
            if (!Run(input))
                return std::fprintf(stderr, "%s: cannot be read\n", input.c_str()), EXIT_FAILURE;
        if (inputs.empty())
            return std::fprintf(stderr, "%s: holds no inputs\n", arguments[i]), EXIT_FAILURE;
        ran += inputs.size();
    }
    std::printf("%zu inputs\n", ran);
    return ran != 0 ? EXIT_SUCCESS : EXIT_FAILURE;
}
