// Output that loses and destroys nothing: files appear when they are whole, what is no regular file is written into, links are
// followed, a signal leaves nothing half-written, and results that standard output did not take are an Error.
#ifndef KEL_EXAMPLES_OUTPUT_H
#define KEL_EXAMPLES_OUTPUT_H

#include <cstddef>
#include <cstdio>
#include <stdexcept>
#include <string>

namespace kel_examples {

// Bad input or output: what was wrong with which file.
struct Error : std::runtime_error {
    using std::runtime_error::runtime_error;
};

// A stream of bytes to standard output (an empty path, or "-") or to a file. A regular file, or one that is not there yet, is
// written beside its place, under a name that starts with ".kel-", and replaced by finish(), its mode kept; a symbolic link stays
// and what it points at is replaced; a device or pipe is written into. Folders and terminals are refused.
class Output {
public:
    explicit Output(const std::string& path);
    ~Output(); // without finish() nothing is left behind
    Output(const Output&) = delete;
    Output& operator=(const Output&) = delete;

    void write(const void* bytes, size_t size);
    void finish();

private:
    void createBeside(const std::string& target);
    [[noreturn]] void fail(int reason) const;

    std::string m_name, m_target, m_unfinished; // as the user calls it; what is replaced; what is written meanwhile
    std::FILE* m_file = nullptr;
    int m_slot = -1;
};

// Makes a folder, and those above it.
void makeFolder(const std::string& path);

// Removes a regular file, and nothing else, where there is one.
void removeOutdated(const std::string& path);

// Signals that end the process remove what is not whole before; a reader that goes away, or a file that may not grow, is an error of
// writing; a closed standard stream stays unusable, so that no file takes its place. To be called first.
void prepareProcess();

// To be called when something has been printed, and at the end: an Error where standard output did not take it.
void flushResults();

// Says on standard error what is being done, in one line that the next call replaces and an empty text clears; only on a terminal.
void showProgress(const std::string& what);

} // namespace kel_examples

#endif
