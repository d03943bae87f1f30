#include "utils/error_queue.h"

namespace TAVO::Utils {

SaveErrorQueue::SaveErrorQueue() {
    const char *file = nullptr;
    int line = 0;
    const char *function = nullptr;
    const char *data = nullptr;
    int flags = 0;
    while (const unsigned long code = ERR_get_error_all(&file, &line, &function, &data, &flags)) {
        entries_.push_back({code, file, line, function, (flags & ERR_TXT_STRING) != 0 ? data : ""});
    }
}

SaveErrorQueue::~SaveErrorQueue() {
    ERR_clear_error();
    for (const Entry &entry : entries_) {
        ERR_new();
        ERR_set_debug(entry.file.c_str(), entry.line, entry.function.c_str());
        if (entry.data.empty()) {
            ERR_set_error(ERR_GET_LIB(entry.code), ERR_GET_REASON(entry.code), nullptr);
        } else {
            ERR_set_error(ERR_GET_LIB(entry.code), ERR_GET_REASON(entry.code), "%s", entry.data.c_str());
        }
    }
}

}  // namespace TAVO::Utils
