// Runs inputs through a fuzz target without libFuzzer, so that ctest can check every corpus with any
// compiler: each file named, and each file of each directory named (in name order), is passed once to
// LLVMFuzzerTestOneInput. A failed invariant or a sanitizer report ends the program.
#include <algorithm>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <vector>

#include "fuzz_support.h"

namespace fs = std::filesystem;

int main(int argc, char** argv) {
    std::vector<fs::path> inputs;
    for (int i = 1; i < argc; ++i) {
        std::vector<fs::path> files{argv[i]};
        if (fs::is_directory(files[0])) {
            files.assign(fs::directory_iterator(argv[i]), fs::directory_iterator());
            std::sort(files.begin(), files.end());
        }
        inputs.insert(inputs.end(), files.begin(), files.end());
    }
    for (const fs::path& path : inputs) {
        std::ifstream in(path, std::ios::binary);
        const std::vector<char> bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
        if (!in && !in.eof()) {
            std::fprintf(stderr, "cannot read %s\n", path.c_str());
            return 1;
        }
        // A buffer of exactly the input's size, as libFuzzer gives, so that a read past its end is caught.
        const std::unique_ptr<uint8_t[]> data(new uint8_t[bytes.size()]);
        std::copy(bytes.begin(), bytes.end(), data.get());
        LLVMFuzzerTestOneInput(data.get(), bytes.size());
    }
    std::fprintf(stderr, "replayed %zu inputs\n", inputs.size());
    return inputs.empty() ? 2 : 0;
}
