#include <algorithm>
#include <cstdio>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

#include "Fuzz.h"

/* Runs every file of the folders that are named through one fuzz target. A finding ends the process
 * while the file's name is the last that was printed. */
namespace {

/** The files of a folder by name; throws where there is no such folder. */
std::vector<std::filesystem::path> listFiles(const std::string& folder) {
    std::vector<std::filesystem::path> files;
    for (const auto& entry : std::filesystem::directory_iterator(folder)) {
        if (entry.is_regular_file()) {
            files.push_back(entry.path());
        }
    }
    std::sort(files.begin(), files.end());
    return files;
}

/** @return false when the file cannot be read */
bool replay(const std::filesystem::path& path) {
    std::printf("%s\n", path.c_str());
    std::fflush(stdout);
    std::ifstream file(path, std::ios::binary);
    const std::vector<char> bytes{std::istreambuf_iterator<char>(file), {}};
    if (!file) {
        std::fprintf(stderr, "cannot read %s\n", path.c_str());
        return false;
    }
    LLVMFuzzerTestOneInput(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size());
    return true;
}

bool replayFolder(const std::string& folder) {
    const std::vector<std::filesystem::path> files = listFiles(folder);
    if (files.empty()) {
        std::fprintf(stderr, "no inputs in %s\n", folder.c_str());
    }
    return !files.empty() && std::all_of(files.begin(), files.end(), replay);
}

}  // namespace

int main(int argc, char** argv) {
    LLVMFuzzerInitialize(&argc, &argv);
    bool isReplayed = argc > 1;
    try {
        for (int i = 1; i < argc; ++i) {
            isReplayed = replayFolder(argv[i]) && isReplayed;
        }
    } catch (const std::exception& failure) {
        std::fprintf(stderr, "%s\n", failure.what());
        isReplayed = false;
    }
    return isReplayed ? 0 : 1;
}
