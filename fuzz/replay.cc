// SPDX-License-Identifier: BSD-2-Clause
// Runs the fuzz target on the corpus, a directory named as the argument, and on every short text
// over some telling alphabets.
#include <cstddef>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size);

namespace {

int tried = 0;

void run(const std::string& text) {
    LLVMFuzzerTestOneInput(reinterpret_cast<const std::uint8_t*>(text.data()), text.size());
    ++tried;
}

void run_every_text(const std::string& alphabet, std::size_t longest, const std::string& text) {
    run(text);
    for (std::size_t i = 0; text.size() < longest && i < alphabet.size(); ++i) {
        run_every_text(alphabet, longest, text + alphabet[i]);
    }
}

} // namespace

int main(int count, char** arguments) {
    if (count != 2) {
        std::cerr << "usage: replay CORPUS\n";
        return 2;
    }
    for (const auto& file : std::filesystem::directory_iterator(arguments[1])) {
        std::ifstream stream(file.path());
        run({std::istreambuf_iterator(stream), {}});
    }
    if (tried == 0) {
        std::cerr << "replay: no corpus\n";
        return 1;
    }
    using namespace std::string_literals;
    run_every_text("09az./:`{A -\n\0\xe9"s, 4, ""); // with the neighbours of 0, 9, a and z
    run_every_text("0a.-", 8, "");                  // versions
    run_every_text("09lbemL./", 5, "");             // schemas
    std::cout << tried << " texts agree\n";
}
