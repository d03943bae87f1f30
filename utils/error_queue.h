#ifndef TAVOSSO_UTILS_ERROR_QUEUE_H
#define TAVOSSO_UTILS_ERROR_QUEUE_H

#include <openssl/err.h>

namespace TAVO::Utils {

/// Removes the library's own entries from the calling thread's OpenSSL error queue, which belongs to the program.
class KeepErrorQueue {
  public:
    KeepErrorQueue() { ERR_set_mark(); }
    ~KeepErrorQueue() { ERR_pop_to_mark(); }
    KeepErrorQueue(const KeepErrorQueue &) = delete;
    KeepErrorQueue &operator=(const KeepErrorQueue &) = delete;
};

}  // namespace TAVO::Utils

#endif
