#include "platform/check/guarded_memory.h"

#include <sys/mman.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <csignal>
#include <system_error>
#include <vector>

#include "platform/check/child_process.h"

namespace PlatformCheck {

namespace {

/// Memory whose access is a fault.
struct Region {
    const char *begin;
    std::size_t size;
    const char *fault;
};

std::vector<Region> regions;

std::size_t PageSize() { return static_cast<std::size_t>(sysconf(_SC_PAGESIZE)); }

void ReportFault(int signal, siginfo_t *information, void * /*context*/) {
    const char *address = static_cast<const char *>(information->si_addr);
    for (const Region &region : regions) {
        if (address >= region.begin && address < region.begin + region.size) {
            NoteFault(region.fault);
        }
    }
    // The access is repeated, and ends the process.
    std::signal(signal, SIG_DFL);
}

void Forbid(char *begin, std::size_t size, int protection, const char *fault) {
    if (mprotect(begin, size, protection) != 0) {
        throw std::system_error(errno, std::generic_category(), "mprotect");
    }
    regions.push_back({begin, size, fault});
    struct sigaction action = {};
    action.sa_sigaction = ReportFault;
    action.sa_flags = SA_SIGINFO;
    sigaction(SIGSEGV, &action, nullptr);
}

}  // namespace

GuardedMemory::GuardedMemory(std::size_t size, const char *fault) : usable_((size / PageSize() + 1) * PageSize()) {
    void *memory = mmap(nullptr, usable_ + PageSize(), PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    if (memory == MAP_FAILED) {
        throw std::system_error(errno, std::generic_category(), "mmap");
    }
    pages_ = static_cast<char *>(memory);
    data_ = pages_ + usable_ - size;
    Forbid(pages_ + usable_, PageSize(), PROT_NONE, fault);
}

GuardedMemory::~GuardedMemory() {
    regions.erase(std::remove_if(regions.begin(), regions.end(),
                                 [this](const Region &region) {
                                     return region.begin == pages_ || region.begin == pages_ + usable_;
                                 }),
                  regions.end());
    munmap(pages_, usable_ + PageSize());
}

GuardedInput::GuardedInput(const std::string &bytes) : GuardedMemory(bytes.size(), "access beyond the end of src") {
    std::copy(bytes.begin(), bytes.end(), data_);
    Forbid(pages_, usable_, PROT_READ, "write to src");
}

GuardedOutput::GuardedOutput(std::size_t size) : GuardedMemory(size, "access beyond the end of dst") {}

}  // namespace PlatformCheck
