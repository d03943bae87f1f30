#ifndef TAVOSSO_UTILS_ERROR_QUEUE_H
#define TAVOSSO_UTILS_ERROR_QUEUE_H

#include <openssl/err.h>

#include <string>
#include <vector>

// The calling thread's error queue of OpenSSL belongs to the program that loads this library: it is left as it was.
namespace TAVO::Utils {

/// Around calls of our own into libcrypto: what they leave in the queue goes again.
class KeepErrorQueue {
  public:
    KeepErrorQueue() { ERR_set_mark(); }
    ~KeepErrorQueue() { ERR_pop_to_mark(); }
    KeepErrorQueue(const KeepErrorQueue &) = delete;
    KeepErrorQueue &operator=(const KeepErrorQueue &) = delete;
};

/// Around calls of others, who clear the queue: it is taken away and put back.
class SaveErrorQueue {
  public:
    SaveErrorQueue();
    ~SaveErrorQueue();
    SaveErrorQueue(const SaveErrorQueue &) = delete;
    SaveErrorQueue &operator=(const SaveErrorQueue &) = delete;

  private:
    struct Entry {
        unsigned long code;
        std::string file;
        int line;
        std::string function;
        std::string data;
    };
    std::vector<Entry> entries_;
};

}  // namespace TAVO::Utils

#endif
