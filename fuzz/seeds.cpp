// SPDX-License-Identifier: Apache-2.0
/* Runs one target on the seeds in a folder, where no fuzzer is linked. */

#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>

extern "C" [[gnu::weak]] int LLVMFuzzerInitialize(int* argc, char*** argv);
extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

int main(int argc, char** argv) {
    if (argc != 2 || (LLVMFuzzerInitialize && LLVMFuzzerInitialize(&argc, &argv) != 0)) return 2;
    bool any = false;
    for (const auto& seed : std::filesystem::directory_iterator{argv[1]}) {
        std::cerr << seed.path().string() << '\n';  // the last one told is the one that fails
        std::ifstream stream{seed.path(), std::ios::binary};
        const std::string content{std::istreambuf_iterator<char>{stream}, {}};
        LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(content.data()), content.size());
        any = true;
    }
    return any ? 0 : 1;
}
