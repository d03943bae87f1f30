#include "tests/support/openssl_errors.h"

#include <openssl/err.h>

namespace Test {

std::vector<std::string> TakeErrorQueue() {
    std::vector<std::string> errors;
    const char *file = nullptr;
    const char *function = nullptr;
    const char *data = nullptr;
    int line = 0;
    int flags = 0;
    while (const unsigned long error = ERR_get_error_all(&file, &line, &function, &data, &flags)) {
        errors.push_back(std::to_string(ERR_GET_REASON(error)) + " " + file + ":" + std::to_string(line) + " " +
                         function + " " + data);
    }
    return errors;
}

}  // namespace Test
