#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

/**
 * Runs a fuzz target over files, as libFuzzer does with files on its command line, but built by any compiler: what a
 * fuzzer has once found stays found. Every file is tried with each first byte, which chooses the change, and cut off
 * at each length.
 */
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

int replay(const std::filesystem::path& path) {
    std::ifstream file(path, std::ios::binary);
    std::vector<char> bytes(std::istreambuf_iterator<char>(file), {});
    int runs = 0;
    const auto run = [&](std::size_t size) {
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(bytes.data()), size); // NOLINT: bytes are bytes
        ++runs;
    };
    for (std::size_t size = 0; size <= bytes.size(); ++size) {
        run(size);
    }
    for (int choice = 0; choice < 128 && !bytes.empty(); ++choice) {
        bytes.front() = static_cast<char>(choice);
        run(bytes.size());
    }
    return runs;
}

} // namespace

int main(int count, char** arguments) {
    std::vector<std::filesystem::path> paths;
    const std::vector<std::string> directories(arguments + 1, arguments + count);
    for (const std::string& directory : directories) {
        for (const auto& entry : std::filesystem::directory_iterator(directory)) {
            paths.push_back(entry.path());
        }
    }
    std::sort(paths.begin(), paths.end());
    int runs = 0;
    for (const auto& path : paths) {
        std::printf("%s\n", path.c_str());
        std::fflush(stdout);
        runs += replay(path);
    }
    std::printf("%zu files, %d runs\n", paths.size(), runs);
    return runs == 0 ? 1 : 0;
}
