// SPDX-License-Identifier: Apache-2.0
#include "support/faults.h"

#include <dlfcn.h>
#include <linux/filter.h>
#include <linux/seccomp.h>
#include <sys/mman.h>
#include <sys/prctl.h>
#include <sys/syscall.h>
#include <sys/uio.h>
#include <ucontext.h>
#include <unistd.h>

#include <array>
#include <cerrno>
#include <csignal>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <iterator>
#include <stdexcept>

#include "support/failing_memory.h"

// The one place whose system calls the filter lets through: number and six arguments, as the kernel takes them.
extern "C" long quo_system_call(long number, const long* arguments);
extern "C" const char quo_system_call_end[];
asm(R"(.text
.hidden quo_system_call, quo_system_call_end
.globl quo_system_call, quo_system_call_end
quo_system_call:
    mov %rdi, %rax
    mov %rsi, %r11
    mov (%r11), %rdi
    mov 8(%r11), %rsi
    mov 16(%r11), %rdx
    mov 24(%r11), %r10
    mov 32(%r11), %r8
    mov 40(%r11), %r9
    syscall
quo_system_call_end:
    ret
)");

namespace {

using test::Call;

/** How a call names its file: by a descriptor, by a path, or by a path from a folder's descriptor on. */
enum class By { kDescriptor, kPath, kFolderAndPath };
struct Row {
    int number;
    Call call;
    By by;
    int length = 0;  // which argument says how many bytes to move
};
constexpr Row kRows[] = {
    {SYS_openat, Call::kOpen, By::kFolderAndPath},
    {SYS_read, Call::kRead, By::kDescriptor, 2},
    {SYS_pread64, Call::kRead, By::kDescriptor, 2},
    {SYS_readv, Call::kRead, By::kDescriptor},
    {SYS_write, Call::kWrite, By::kDescriptor, 2},
    {SYS_pwrite64, Call::kWrite, By::kDescriptor, 2},
    {SYS_writev, Call::kWrite, By::kDescriptor},
    {SYS_fsync, Call::kSync, By::kDescriptor},
    {SYS_close, Call::kClose, By::kDescriptor},
    {SYS_rename, Call::kRename, By::kPath},
    {SYS_renameat, Call::kRename, By::kFolderAndPath},
    {SYS_renameat2, Call::kRename, By::kFolderAndPath},
    {SYS_linkat, Call::kLink, By::kFolderAndPath},
    {SYS_ftruncate, Call::kResize, By::kDescriptor},
    {SYS_fallocate, Call::kResize, By::kDescriptor},
    {SYS_fchmod, Call::kMode, By::kDescriptor},
    {SYS_fchown, Call::kOwner, By::kDescriptor},
    {SYS_flock, Call::kLock, By::kDescriptor},
    {SYS_copy_file_range, Call::kCopy, By::kDescriptor, 4},
    {SYS_sendfile, Call::kCopy, By::kDescriptor, 3},
    {SYS_newfstatat, Call::kStat, By::kFolderAndPath},
    {SYS_access, Call::kAccess, By::kPath},
    {SYS_faccessat2, Call::kAccess, By::kFolderAndPath},
    {SYS_readlink, Call::kReadLink, By::kPath},
    {SYS_unlink, Call::kUnlink, By::kPath},
    {SYS_unlinkat, Call::kUnlink, By::kFolderAndPath},
};

test::Watch* watched = nullptr;
std::array<bool, 1024> in_folder{};  // by descriptor
bool refusing_waits = false;         // of a preloaded program, for the first file that it looks at

using Arguments = std::array<long, 6>;

bool is_watched(long descriptor) {
    return descriptor >= 0 && descriptor < std::ssize(in_folder) &&
           in_folder[static_cast<std::size_t>(descriptor)];
}
bool is_below(long path) {
    const char* const text = reinterpret_cast<const char*>(path);
    return text != nullptr && std::strncmp(text, watched->folder, std::strlen(watched->folder)) == 0;
}
bool concerns_folder(const Row& row, const Arguments& arguments) {
    if (row.by == By::kPath) return is_below(arguments[0]);
    return is_watched(arguments[0]) || (row.by == By::kFolderAndPath && is_below(arguments[1]));
}

/** Counts the call; whether the fault strikes it. */
bool strikes(const Row& row) {
    const test::Fault& fault = watched->fault;
    for (const Call kind : {row.call, Call::kAny}) {
        ++watched->counted[0][static_cast<int>(kind)];
        if (row.length != 0) ++watched->counted[1][static_cast<int>(kind)];
    }
    if (fault.call != row.call && fault.call != Call::kAny) return false;
    if (fault.error == test::kShort && row.length == 0) return false;
    const long now = ++watched->calls;
    if (now != fault.nth && !(fault.forever && now > fault.nth)) return false;
    watched->reached = true;
    return true;
}

long perform(const Row& row, const Arguments& arguments) {
    if (row.call == Call::kSync) return 0;
    const long result = quo_system_call(row.number, arguments.data());
    const bool opens = row.call == Call::kOpen && result >= 0 && result < std::ssize(in_folder);
    if (opens || row.call == Call::kClose) {
        in_folder[static_cast<std::size_t>(opens ? result : arguments[0])] = opens;
        watched->descriptors += opens ? 1 : -1;
    }
    return result;
}

/** What a struck call gives. A descriptor is closed whatever its closing says, as the kernel has it. */
long fail(const Row& row, Arguments arguments) {
    const int error = watched->fault.error;
    if (error == test::kKill) {
        const long self = quo_system_call(SYS_getpid, arguments.data());
        (void)quo_system_call(SYS_kill, Arguments{self, SIGKILL}.data());
    }
    if (error == test::kShort) {
        long& length = arguments[static_cast<std::size_t>(row.length)];
        length -= length / 2;
        return perform(row, arguments);
    }
    if (row.call == Call::kClose) (void)perform(row, arguments);
    return -error;
}

void refuse_memory_now() {
    refusing_waits = false;
    watched->reached = true;  // should the refusal end the process
    test::refuse_memory(watched->fault.nth - 1, !watched->fault.forever);
}

void handle(int /*signal*/, siginfo_t* about, void* context) {
    auto& registers = static_cast<ucontext_t*>(context)->uc_mcontext.gregs;
    const Arguments arguments{registers[REG_RDI], registers[REG_RSI], registers[REG_RDX],
                              registers[REG_R10], registers[REG_R8],  registers[REG_R9]};
    long result = -ENOSYS;
    for (const Row& row : kRows) {
        if (row.number != about->si_syscall) continue;
        if (!concerns_folder(row, arguments)) {
            result = quo_system_call(row.number, arguments.data());
            continue;
        }
        result = strikes(row) ? fail(row, arguments) : perform(row, arguments);
        if (refusing_waits) refuse_memory_now();
    }
    registers[REG_RAX] = result;
}

sock_filter load(std::size_t offset) {
    return BPF_STMT(BPF_LD | BPF_W | BPF_ABS, static_cast<std::uint32_t>(offset));
}
sock_filter jump(std::uint64_t equal, std::size_t then, std::size_t otherwise) {
    return BPF_JUMP(BPF_JMP | BPF_JEQ | BPF_K, static_cast<std::uint32_t>(equal), static_cast<std::uint8_t>(then),
                    static_cast<std::uint8_t>(otherwise));
}
sock_filter decide(std::uint32_t action) { return BPF_STMT(BPF_RET | BPF_K, action); }

/** Traps the calls of the table, except from quo_system_call(). */
bool install_filter() {
    constexpr std::size_t kCount = std::size(kRows), kHead = 6;
    const auto allowed = reinterpret_cast<std::uint64_t>(quo_system_call_end);
    std::array<sock_filter, kHead + kCount + 2> program{};
    program[0] = load(offsetof(seccomp_data, instruction_pointer));
    program[1] = jump(allowed, 0, 3);
    program[2] = load(offsetof(seccomp_data, instruction_pointer) + 4);
    program[3] = jump(allowed >> 32U, 0, 1);
    program[4] = decide(SECCOMP_RET_ALLOW);
    program[5] = load(offsetof(seccomp_data, nr));
    for (std::size_t i = 0; i < kCount; ++i)
        program[kHead + i] = jump(static_cast<std::uint64_t>(kRows[i].number), kCount - i, 0);
    program[kHead + kCount] = decide(SECCOMP_RET_ALLOW);
    program[kHead + kCount + 1] = decide(SECCOMP_RET_TRAP);
    const sock_fprog filter{program.size(), program.data()};
    return prctl(PR_SET_NO_NEW_PRIVS, 1, 0, 0, 0) == 0 && prctl(PR_SET_SECCOMP, SECCOMP_MODE_FILTER, &filter) == 0;
}

// In a program that this is preloaded into.
[[gnu::constructor]] void watch_preloaded() {
    const char* const descriptor = std::getenv(test::kWatchVariable);
    if (!descriptor) return;
    const auto number = static_cast<int>(std::strtol(descriptor, nullptr, 10));
    void* const shared = mmap(nullptr, sizeof(test::Watch), PROT_READ | PROT_WRITE, MAP_SHARED, number, 0);
    if (shared == MAP_FAILED) std::abort();
    test::start_watching(static_cast<test::Watch*>(shared));
    refusing_waits = watched->fault.call == Call::kMemory;
}
/** The main program, which runs where it uses no file as well. */
int (*actual_main)(int, char**, char**) = nullptr;
int run_main(int count, char** arguments, char** environment) {
    if (refusing_waits && !watched->uses_files) refuse_memory_now();
    return actual_main(count, arguments, environment);
}
[[gnu::destructor]] void tell_of_memory() {
    if (watched && watched->fault.call == Call::kMemory && !refusing_waits)
        watched->reached = test::stop_refusing();
}

}  // namespace

// What static objects of a program take is taken before its main function, which could not help it.
extern "C" [[gnu::visibility("default")]] int __libc_start_main(decltype(actual_main) main, int count,
                                                                char** arguments, void (*begin)(), void (*end)(),
                                                                void (*end_of_libraries)(), void* stack) {
    const auto next = reinterpret_cast<decltype(&__libc_start_main)>(dlsym(RTLD_NEXT, "__libc_start_main"));
    actual_main = main;
    return next(run_main, count, arguments, begin, end, end_of_libraries, stack);
}

void test::start_watching(Watch* watch) {
    watched = watch;
    struct sigaction action {};
    action.sa_sigaction = handle;
    action.sa_flags = SA_SIGINFO | SA_NODEFER;
    if (sigaction(SIGSYS, &action, nullptr) != 0 || !install_filter())
        throw std::runtime_error("system calls cannot be watched here");
    errno = 0;
}
