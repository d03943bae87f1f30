// Runs a target with its seeds. It must accept those whose name begins with "accepted", and no others.
//
//   replay FOLDER
#include <algorithm>
#include <exception>
#include <filesystem>
#include <fstream>
#include <iostream>
#include <iterator>
#include <random>
#include <set>
#include <stdexcept>
#include <vector>

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

/// Replaces, inserts, removes, repeats or swaps up to four pieces of a seed.
std::string Mutate(std::string input, std::mt19937 &random) {
    constexpr char kCharacters[] = "ABCabc019-_+/=.{}\"\0\x80 ";
    for (auto edits = random() % 4 + 1; edits > 0; --edits) {
        const std::size_t at = random() % (input.size() + 1);
        const std::size_t length = random() % 8;
        const char character = kCharacters[random() % (sizeof kCharacters - 1)];
        switch (random() % 5) {
            case 0:
                input.replace(at, std::min<std::size_t>(1, input.size() - at), 1, character);
                break;
            case 1:
                input.insert(at, 1, character);
                break;
            case 2:
                input.erase(at, length);
                break;
            case 3:
                input.insert(at, input.substr(random() % (input.size() + 1), length));
                break;
            default:
                input.insert(at, std::string(random() % 2000, character));
        }
    }
    return input;
}

/// Prints a verdict for each of `count` mutations of the seeds, the same ones on each platform, to compare platforms.
void PrintVerdicts(const std::filesystem::path &folder, unsigned long count) {
    const std::filesystem::directory_iterator entries(folder);
    const std::set<std::filesystem::path> paths(begin(entries), end(entries));
    std::vector<std::string> seeds;
    std::transform(paths.begin(), paths.end(), std::back_inserter(seeds), ReadFile);
    std::mt19937 random(1);  // NOLINT(cert-msc51-cpp): the same on each platform
    for (unsigned long i = 0; i < count; ++i) {
        const std::string input = Mutate(seeds.at(random() % seeds.size()), random);
        std::cout << i << ' ' << input.size() << ' ';
        try {
            std::cout << (Fuzz::Accepts(input) ? "accepted" : "refused") << '\n';
        } catch (const Fuzz::ViolatedProperty &violated) {
            std::cout << "violates: " << violated.property << '\n';
        }
    }
}

}  // namespace

// replay SEEDS [MUTATIONS]
int main(int argc, char **argv) try {
    if (argc == 3) {
        PrintVerdicts(argv[1], std::stoul(argv[2]));
        return 0;
    }
    return argc == 2 && Failures(argv[1]) == 0 ? 0 : 1;
} catch (const std::exception &error) {
    std::cerr << error.what() << std::endl;
    return 1;
}
