// Converts the names on standard input, one per line. Prints a line of JSON for each: the name or null, and the log
// lines.
//
//   convert [UID]      UID: runs as this user
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <iostream>
#include <string>

#include "platform/platform.h"
#include "tests/support/system_log.h"
#include "tests/support/token.h"

namespace {

constexpr char kMark = '#';

Json::Value Convert(const std::string &name) {
    std::string buffer(1024, kMark);
    const std::string untouched = buffer;
    const int status = TAVOWinsUserNameFqdn2Netbios(name.c_str(), buffer.data(), buffer.size() - 1);
    Json::Value result;
    if (status >= 0) {
        result["name"] = buffer.c_str();
    } else {
        result["name"] = buffer == untouched ? Json::Value() : Json::Value("the buffer was changed");
    }
    result["log"] = Json::Value(Json::arrayValue);
    for (const Test::LogLine &line : Test::TakeSystemLog()) {
        result["log"].append(line.text);
    }
    return result;
}

}  // namespace

int main(int argc, char **argv) {
    if (argc == 2) {
        const auto id = static_cast<uid_t>(std::strtoul(argv[1], nullptr, 10));
        if (setresgid(id, id, id) != 0 || setresuid(id, id, id) != 0) {
            std::cerr << std::strerror(errno) << std::endl;
            return 1;
        }
    }
    for (std::string name; std::getline(std::cin, name);) {
        std::cout << Test::Compact(Convert(name)) << std::endl;
    }
}
