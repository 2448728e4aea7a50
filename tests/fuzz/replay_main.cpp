// Replays a corpus through a fuzz target without libFuzzer, so that the committed corpus is a
// regression suite in every build (gcc, sanitizers or not). Usage:
//   replay_<target> [--seconds=S] <file or directory>...
// Fails on the first input whose call aborts (an invariant) or takes longer than S seconds
// (default 1), and when no input was found at all.
#include <algorithm>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size);

namespace {

namespace fs = std::filesystem;

std::vector<fs::path> inputsUnder(const fs::path& path) {
    std::vector<fs::path> files;
    if (fs::is_directory(path)) {
        for (const auto& entry : fs::directory_iterator(path)) {
            if (entry.is_regular_file()) files.push_back(entry.path());
        }
        std::sort(files.begin(), files.end());
    } else if (fs::is_regular_file(path)) {
        files.push_back(path);
    }
    return files;
}

}  // namespace

int main(int argc, char** argv) {
    double limitSeconds = 1.0;
    std::vector<fs::path> files;
    for (int i = 1; i < argc; ++i) {
        const std::string argument = argv[i];
        if (argument.rfind("--seconds=", 0) == 0) {
            limitSeconds = std::atof(argument.c_str() + 10);
            continue;
        }
        const std::vector<fs::path> found = inputsUnder(argument);
        files.insert(files.end(), found.begin(), found.end());
    }
    if (files.empty()) {
        std::fprintf(stderr, "no inputs found\n");
        return 2;
    }

    double slowest = 0.0;
    std::string slowestName;
    for (const fs::path& file : files) {
        std::ifstream stream(file, std::ios::binary);
        const std::vector<char> content((std::istreambuf_iterator<char>(stream)),
                                        std::istreambuf_iterator<char>());
        std::fprintf(stderr, "%s\n", file.c_str());
        const auto start = std::chrono::steady_clock::now();
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(content.data()),
                               content.size());
        const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - start;
        if (elapsed.count() > slowest) {
            slowest = elapsed.count();
            slowestName = file.filename().string();
        }
        if (elapsed.count() > limitSeconds) {
            std::fprintf(stderr, "too slow: %s took %.3f s (limit %.3f s)\n", file.c_str(),
                         elapsed.count(), limitSeconds);
            return 1;
        }
    }
    std::printf("%zu inputs, slowest %s at %.4f s\n", files.size(), slowestName.c_str(), slowest);
    return 0;
}
