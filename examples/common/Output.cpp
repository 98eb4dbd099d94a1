// Output on the POSIX interface: temporary files, links, signals.
#include "Output.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <csignal>
#include <cstring>
#include <fcntl.h>
#include <filesystem>
#include <initializer_list>
#include <sys/stat.h>
#include <unistd.h>

namespace kel_examples {

namespace {

namespace fs = std::filesystem;

constexpr std::initializer_list<int> kEndingSignals = {SIGHUP, SIGINT, SIGQUIT, SIGTERM, SIGABRT};

// Names of the files that are not whole yet, where the signal handler finds them without any lock.
struct Slot {
    std::atomic<bool> used{false};
    char path[4096];
};
Slot slots[8];

extern "C" void removeUnfinished(int signal) {
    for (const Slot& slot : slots)
        if (slot.used)
            unlink(slot.path);
    std::signal(signal, SIG_DFL);
    raise(signal);
}

sigset_t endingSignals() {
    sigset_t set;
    sigemptyset(&set);
    for (const int signal : kEndingSignals)
        sigaddset(&set, signal);
    return set;
}

// Follows symbolic links, also to what is not there.
fs::path followLinks(fs::path path) {
    std::error_code code;
    for (int i = 0; i < 40 && fs::is_symlink(fs::symlink_status(path, code)); ++i)
        path = path.parent_path() / fs::read_symlink(path, code);
    return path;
}

bool isSame(const struct stat& a, const struct stat& b) {
    return a.st_dev == b.st_dev && a.st_ino == b.st_ino;
}

} // namespace

Output::Output(const std::string& path) : m_name(path) {
    struct stat there, other;
    if (path.empty() || path == "-") {
        m_name = "standard output";
        m_file = stdout;
    } else if (stat(path.c_str(), &there) != 0) {
        if (errno != ENOENT)
            fail(errno);
        createBeside(followLinks(path));
    } else if (S_ISDIR(there.st_mode)) {
        throw Error(path + ": is a folder");
    } else if (fstat(STDOUT_FILENO, &other) == 0 && isSame(there, other)) {
        m_file = stdout;
    } else if (S_ISREG(there.st_mode)) {
        if (access(path.c_str(), W_OK) != 0)
            fail(errno);
        const std::string target = followLinks(path);
        if (stat(target.c_str(), &other) == 0 && isSame(there, other))
            createBeside(target);
        else // a link of the system's own, such as those of open files
            m_file = std::fopen(path.c_str(), "wb");
    } else {
        const int fd = open(path.c_str(), O_WRONLY | O_NOCTTY | O_CLOEXEC);
        m_file = fd < 0 ? nullptr : fdopen(fd, "wb");
    }
    if (!m_file)
        fail(errno);
    if (isatty(fileno(m_file))) {
        if (m_file != stdout)
            std::fclose(m_file);
        throw Error(m_name + ": is a terminal, which cannot show this; name a file or a pipe");
    }
}

void Output::createBeside(const std::string& target) {
    m_target = target;
    std::string name = (fs::path(target).parent_path() / ".kel-XXXXXX").string();
    Slot* const slot = std::find_if(std::begin(slots), std::end(slots), [](const Slot& s) { return !s.used; });
    if (slot == std::end(slots) || name.size() >= sizeof slot->path)
        fail(ENAMETOOLONG);
    struct stat there;
    const bool replaced = stat(target.c_str(), &there) == 0;
    const mode_t mask = umask(0);
    umask(mask);
    const sigset_t ending = endingSignals();
    sigset_t before;
    sigprocmask(SIG_BLOCK, &ending, &before);
    const int fd = mkostemp(name.data(), O_CLOEXEC), reason = errno;
    if (fd >= 0) {
        std::strcpy(slot->path, name.c_str());
        slot->used = true;
        m_slot = static_cast<int>(slot - slots);
        m_unfinished = name;
    }
    sigprocmask(SIG_SETMASK, &before, nullptr);
    if (fd < 0)
        fail(reason);
    if (replaced && fchown(fd, there.st_uid, there.st_gid) != 0)
        errno = 0; // another's file stays writable for its readers by its mode alone
    fchmod(fd, replaced ? there.st_mode & 07777 : 0666 & ~mask);
    m_file = fdopen(fd, "wb");
}

Output::~Output() {
    if (m_file && m_file != stdout)
        std::fclose(m_file);
    if (!m_unfinished.empty())
        unlink(m_unfinished.c_str());
    if (m_slot >= 0)
        slots[m_slot].used = false;
}

void Output::write(const void* bytes, size_t size) {
    if (std::fwrite(bytes, 1, size, m_file) != size)
        fail(errno);
}

void Output::finish() {
    if (std::fflush(m_file) != 0)
        fail(errno);
    if (m_file == stdout)
        return;
    std::FILE* const file = m_file;
    m_file = nullptr;
    if (std::fclose(file) != 0 || (!m_unfinished.empty() && std::rename(m_unfinished.c_str(), m_target.c_str()) != 0))
        fail(errno);
    m_unfinished.clear();
}

void Output::fail(int reason) const {
    throw Error(m_name + ": cannot be written: " + std::strerror(reason));
}

void makeFolder(const std::string& path) {
    std::error_code code;
    fs::create_directories(path, code);
    if (!fs::is_directory(path))
        throw Error(path + ": cannot be made: " + (code ? code.message() : std::string("it is no folder")));
    if (access(path.c_str(), W_OK) != 0)
        throw Error(path + ": cannot be written into: " + std::strerror(errno));
}

void removeOutdated(const std::string& path) {
    std::error_code code;
    if (fs::is_regular_file(fs::symlink_status(path, code)))
        fs::remove(path, code);
}

void prepareProcess() {
    for (int fd = 0; fd < 3;
         ++fd) // the lowest free number is the closed one; reading only where it is for writing, and the reverse
        if (fcntl(fd, F_GETFD) < 0)
            open("/dev/null", fd == 0 ? O_WRONLY : O_RDONLY);
    std::signal(SIGPIPE, SIG_IGN);
    std::signal(SIGXFSZ, SIG_IGN);
    struct sigaction ours {
    }, before;
    ours.sa_handler = removeUnfinished;
    ours.sa_mask = endingSignals();
    for (const int signal : kEndingSignals)
        if (sigaction(signal, nullptr, &before) == 0 && before.sa_handler != SIG_IGN) // what nohup has said stays
            sigaction(signal, &ours, nullptr);
}

void flushResults() {
    errno = 0;
    if (std::fflush(stdout) != 0 || std::ferror(stdout))
        throw Error(std::string("standard output: cannot be written: ") + std::strerror(errno ? errno : EIO));
}

void showProgress(const std::string& what) {
    static const bool terminal = isatty(STDERR_FILENO);
    static bool shown = false;
    if (!terminal || (what.empty() && !shown))
        return;
    std::fprintf(stderr, "\r\033[K%s", what.c_str()); // the start of the line, the rest of it cleared
    std::fflush(stderr);
    shown = !what.empty();
}

} // namespace kel_examples
