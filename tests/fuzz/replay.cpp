// Runs a target with its seeds. It must accept those whose name begins with "accepted", and no others.
//
//   replay FOLDER
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <set>
#include <stdexcept>

#include "tests/fuzz/target.h"

namespace {

constexpr char kGoodPrefix[] = "accepted";
constexpr char kEitherPrefix[] = "either";  // versions of jsoncpp differ

std::string ReadFile(const std::filesystem::path &path) {
    std::ifstream file(path, std::ios::binary);
    std::string content{std::istreambuf_iterator<char>(file), {}};
    if (!file) {
        throw std::runtime_error("cannot read " + path.string());
    }
    return content;
}

bool Passes(const std::filesystem::path &seed) {
    const std::string name = seed.filename();
    try {
        const bool accepted = Fuzz::Accepts(ReadFile(seed));
        const bool expected = name.rfind(kEitherPrefix, 0) == 0 || accepted == (name.rfind(kGoodPrefix, 0) == 0);
        std::cout << name << ": " << (accepted ? "accepted" : "refused") << (expected ? "" : ", WRONGLY") << std::endl;
        return expected;
    } catch (const Fuzz::ViolatedProperty &) {
        std::cout << name << ": VIOLATES A PROPERTY" << std::endl;
        return false;
    }
}

/// The number of failed seeds. A folder without an accepted seed counts as a failure.
int Failures(const std::filesystem::path &folder) {
    const std::filesystem::directory_iterator entries(folder);
    const std::set<std::filesystem::path> seeds(begin(entries), end(entries));
    int failures = 0;
    bool anyGood = false;
    for (const std::filesystem::path &seed : seeds) {
        failures += Passes(seed) ? 0 : 1;
        anyGood = anyGood || seed.filename().string().rfind(kGoodPrefix, 0) == 0;
    }
    std::cout << seeds.size() << " seeds, " << failures << " failed" << std::endl;
    return anyGood ? failures : failures + 1;
}

}  // namespace

int main(int argc, char **argv) try {
    return argc == 2 && Failures(argv[1]) == 0 ? 0 : 1;
} catch (const std::exception &error) {
    std::cerr << error.what() << std::endl;
    return 1;
}
