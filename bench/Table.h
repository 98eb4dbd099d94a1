// What the measurements come to, as a table, as values for other programs, and as a picture.
#ifndef KEL_BENCH_TABLE_H
#define KEL_BENCH_TABLE_H

#include <map>
#include <string>
#include <utility>
#include <vector>

namespace kel_bench {

// Ratios kel / best peer by operation and size.
using Ratios = std::map<std::pair<std::string, std::string>, double>;

// One line: times in microseconds, NAN where there is none; `avx2` and `sse41` are ratios with the kernels of those
// instructions.
struct Row {
    std::string operation, size, peer, differs;
    double kel, best, bound, avx2, sse41;
    double ratio() const { return kel / best; }
};

std::string table(const std::vector<Row>& rows);
std::string csv(const std::vector<Row>& rows);
Ratios ratiosOf(const std::string& csvPath); // of a file that csv() has made

// Every operation over images at 1920x1080 on a logarithmic scale, those behind their best peer as plain to see as those ahead.
std::string picture(const std::vector<Row>& rows);

} // namespace kel_bench

#endif
