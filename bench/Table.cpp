// The table of ratios and the values behind it.
#include "Table.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>
#if KEL_BENCH_OPENCV
#include <opencv2/core.hpp>
#endif

namespace kel_bench {

namespace {

std::string number(double value, const char* format) {
    if (std::isnan(value))
        return "-";
    char text[32];
    std::snprintf(text, sizeof text, format, value);
    return text;
}

// Geometric mean of the ratios of rows that `chosen` chooses.
template <class Chosen, class Ratio> double meanOf(const std::vector<Row>& rows, Chosen chosen, Ratio ratio) {
    double sum = 0;
    int count = 0;
    for (const Row& row : rows)
        if (chosen(row) && !std::isnan(ratio(row))) {
            sum += std::log(ratio(row));
            ++count;
        }
    return count ? std::exp(sum / count) : NAN;
}

bool isPicture(const Row& row) {
    return row.size == "1920x1080";
}

std::string modelName() {
    std::ifstream info("/proc/cpuinfo");
    for (std::string line; std::getline(info, line);)
        if (line.rfind("model name", 0) == 0)
            return line.substr(line.find(':') + 2);
    return "unknown processor";
}

std::string peers() {
    std::string text;
    const auto append = [&](const char* peer, bool present) {
        text += (text.empty() ? "" : ", ") + std::string(peer) + (present ? "" : " (absent)");
    };
#if KEL_BENCH_OPENCV
    append("OpenCV " CV_VERSION, true);
#else
    append("OpenCV", false);
#endif
    append("libyuv", KEL_BENCH_LIBYUV);
    append("Eigen", KEL_BENCH_EIGEN);
    append("LAPACK", KEL_BENCH_LAPACK);
    return text;
}

std::string kernels() {
    return __builtin_cpu_supports("avx512vbmi") ? "AVX-512" : __builtin_cpu_supports("avx2") ? "AVX2" : "SSE4.1";
}

// Operations over images that take longer than the best peer, the worst first.
std::string behind(const std::vector<Row>& rows) {
    std::multimap<double, std::string> lines;
    int count = 0;
    for (const Row& row : rows)
        if (isPicture(row) && !std::isnan(row.ratio())) {
            ++count;
            if (row.ratio() > 1.05)
                lines.insert({-row.ratio(), row.operation + " " + number(row.ratio(), "%.2f")});
        }
    if (count == 0)
        return "";
    std::string text = "Behind the best peer by more than 5 % at 1920x1080 in " + std::to_string(lines.size()) + " of " +
                       std::to_string(count) + " lines";
    const char* mark = ": ";
    for (const auto& line : lines) {
        text += mark + line.second;
        mark = "; ";
    }
    return text + ".\n";
}

} // namespace

std::string table(const std::vector<Row>& rows) {
    std::ostringstream out;
    out << modelName() << ", GCC " << __VERSION__ << ", one thread; medians of process CPU time in microseconds.\n"
        << "Peers: " << peers() << ". Kel takes its kernels for " << kernels()
        << " there, the peers what they find.\nRatio: kel / best peer, below 1 kel is faster; with the kernels for AVX2 and "
           "SSE4.1 "
           "too where those were measured. Bound: a plain pass over the same bytes.\n\n"
        << "| operation | size | kel | best peer | ratio | AVX2 | SSE4.1 | to bound | the peer differs in |\n"
        << "|---|---|---:|---:|---:|---:|---:|---:|---|\n";
    for (const Row& row : rows)
        out << "| " << row.operation << " | " << row.size << " | " << number(row.kel, "%.4g") << " | "
            << (std::isnan(row.best) ? "-" : number(row.best, "%.4g") + " " + row.peer) << " | " << number(row.ratio(), "%.2f")
            << " | " << number(row.avx2, "%.2f") << " | " << number(row.sse41, "%.2f") << " | "
            << number(row.kel / row.bound, "%.2f") << " | " << row.differs << " |\n";
    const auto all = [](const Row&) { return true; };
    out << "\nGeometric mean of the ratios: " << number(meanOf(rows, isPicture, [](const Row& r) { return r.ratio(); }), "%.2f")
        << " at 1920x1080 (" << number(meanOf(rows, isPicture, [](const Row& r) { return r.avx2; }), "%.2f") << " with AVX2, "
        << number(meanOf(rows, isPicture, [](const Row& r) { return r.sse41; }), "%.2f") << " with SSE4.1), "
        << number(meanOf(rows, all, [](const Row& r) { return r.ratio(); }), "%.2f") << " over all lines.\n"
        << behind(rows);
    return out.str();
}

std::string csv(const std::vector<Row>& rows) {
    std::ostringstream out;
    out << "operation,size,kel_us,best_us,peer,ratio,bound_us,differs\n";
    for (const Row& row : rows)
        out << '"' << row.operation << "\"," << row.size << ',' << row.kel << ',' << row.best << ',' << row.peer << ','
            << row.ratio() << ',' << row.bound << ",\"" << row.differs << "\"\n";
    return out.str();
}

Ratios ratiosOf(const std::string& csvPath) {
    Ratios ratios;
    std::ifstream in(csvPath);
    std::string line;
    for (std::getline(in, line); std::getline(in, line);) {
        const size_t end = line.find('"', 1);
        std::istringstream rest(line.substr(end + 2));
        std::string field[5]; // size, kel, best, peer, ratio
        for (std::string& f : field)
            std::getline(rest, f, ',');
        ratios[{line.substr(1, end - 1), field[0]}] = std::strtod(field[4].c_str(), nullptr);
    }
    return ratios;
}

} // namespace kel_bench
