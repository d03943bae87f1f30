#include "utils/root_privilege.h"

#include <sys/types.h>
#include <syslog.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "utils/json.h"

namespace TAVO::Utils {

namespace {

// strerror_r has two forms: GNU's returns the text, POSIX's fills the buffer.
[[maybe_unused]] const char *ErrorText(const char *text, const char * /*buffer*/) { return text; }
// GCOVR_EXCL_START: glibc with the default macros of g++ and clang uses the other form
[[maybe_unused]] const char *ErrorText(int /*result*/, const char *buffer) { return buffer; }
// GCOVR_EXCL_STOP

/// Raises the process's effective ids to root's for its lifetime, if the process may.
class RootPrivilege {
  public:
    RootPrivilege(const char *source, int line)
        : source_(source), line_(line), savedUID_(geteuid()), savedGID_(getegid()) {
        Report(Enter(), "%s:%d ERROR: ENTERCriticalSection");
    }

    ~RootPrivilege() { Report(Leave(), "%s:%d ERROR: LEAVECriticalSection"); }

    RootPrivilege(const RootPrivilege &) = delete;
    RootPrivilege &operator=(const RootPrivilege &) = delete;

  private:
    // Only effective uid 0 may change the group, so Leave returns to it before it restores the group.
    bool Enter() { return (savedGID_ == 0 || SetEffectiveGID(0)) && (savedUID_ == 0 || SetEffectiveUID(0)); }

    bool Leave() {
        const bool changeUID = geteuid() != savedUID_;
        const bool changeGID = getegid() != savedGID_;
        return (!changeUID || SetEffectiveUID(0)) && (!changeGID || SetEffectiveGID(savedGID_)) &&
               (!changeUID || SetEffectiveUID(savedUID_));
    }

    static constexpr unsigned int kUnchanged = static_cast<unsigned int>(-1);  // the real and saved ids

    bool SetEffectiveGID(gid_t gid) { return Logged("resgid", gid, setresgid(kUnchanged, gid, kUnchanged)); }
    bool SetEffectiveUID(uid_t uid) { return Logged("resuid", uid, setresuid(kUnchanged, uid, kUnchanged)); }

    bool Logged(const char *name, unsigned int id, int result) {
        if (result != 0) {
            char buffer[1024] = {};
            const char *text = ErrorText(strerror_r(errno, buffer, sizeof buffer), buffer);
            syslog(LOG_AUTH | LOG_ERR, "%s:%d ERROR: set%s(%d, %d, %d) [%s]", source_, line_, name, -1,
                   static_cast<int>(id), -1, text);
        } else if (id == 0) {
            syslog(LOG_AUTH | LOG_INFO, "%s:%d WARNING: set%s(%d, %d, %d)", source_, line_, name, -1, 0, -1);
        }
        return result == 0;
    }

    void Report(bool succeeded, const char *failure) {
        errno = succeeded ? 0 : 1;
        if (!succeeded) {
            syslog(LOG_AUTH | LOG_ERR, failure, source_, line_);
            errno = 1;  // syslog may have changed it
        }
    }

    const char *source_;
    int line_;
    uid_t savedUID_;
    gid_t savedGID_;
};

}  // namespace

bool LoadJsonFileAsRoot(const char *source, int line, const char *path, Json::Value &document) {
    const RootPrivilege privilege(source, line);
    return LoadJsonFile(path, document);
}

}  // namespace TAVO::Utils
