#ifndef TAVOSSO_UTILS_ERROR_QUEUE_H
#define TAVOSSO_UTILS_ERROR_QUEUE_H

#include <openssl/err.h>

namespace TAVO::Utils {

/// Removes what our calls into libcrypto add to the calling thread's OpenSSL error queue: the queue is the host's.
class KeepErrorQueue {
  public:
    KeepErrorQueue() { ERR_set_mark(); }
    ~KeepErrorQueue() { ERR_pop_to_mark(); }
    KeepErrorQueue(const KeepErrorQueue &) = delete;
    KeepErrorQueue &operator=(const KeepErrorQueue &) = delete;
};

}  // namespace TAVO::Utils

#endif
