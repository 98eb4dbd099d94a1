// Runs the lines under Google Benchmark, takes medians of process CPU time, and prints the table of ratios.
#include "Bench.h"
#include "Table.h"

#include <algorithm>
#include <benchmark/benchmark.h>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <iostream>
#include <map>
#include <sstream>
#include <tuple>
#if KEL_BENCH_OPENCV
#include <opencv2/core.hpp>
#endif

namespace kel_bench {

const std::vector<ImageSize> kImageSizes = {{640, 480, "640x480"}, {1920, 1080, "1920x1080"}, {3840, 2160, "3840x2160"}};

namespace {

struct Line {
    std::string operation, size;
    std::vector<Run> runs; // kel, peers, then the bound where there is one
};

std::vector<Line>& lines() {
    static std::vector<Line> all;
    return all;
}

std::vector<void (*)()>& adders() {
    static std::vector<void (*)()> all;
    return all;
}

const char* const kBound = "bound";

// A plain pass: copies what is both read and written, sets what is only written, sums what is only read.
Body plainPass(Traffic traffic) {
    const size_t read = static_cast<size_t>(traffic.read), written = static_cast<size_t>(traffic.written);
    auto src = std::make_shared<std::vector<unsigned char>>(read + 8, 1);
    auto dst = std::make_shared<std::vector<unsigned char>>(written + 8, 2);
    return [=] {
        const size_t both = std::min(read, written);
        memcpy(dst->data(), src->data(), both);
        memset(dst->data() + both, 3, written - both);
        uint64_t sum = 0;
        for (size_t i = both; i + 8 <= read; i += 8) {
            uint64_t word;
            memcpy(&word, src->data() + i, 8);
            sum += word;
        }
        benchmark::DoNotOptimize(sum);
        benchmark::ClobberMemory();
    };
}

std::string name(const Line& line, const Run& run) {
    return line.operation + "/" + line.size + "/" + run.who;
}

double median(std::vector<double> values) {
    if (values.empty())
        return NAN;
    std::sort(values.begin(), values.end());
    return values[values.size() / 2];
}

// Whether a run failed, as Google Benchmark says it before 1.8 and since.
template <class Run> auto hasFailed(const Run& run, int) -> decltype(run.error_occurred) {
    return run.error_occurred;
}
template <class Run> bool hasFailed(const Run& run, long) {
    return static_cast<int>(run.skipped) != 0;
}

// Keeps the time of every repetition, in microseconds, and leaves a mark of progress.
class Collector : public benchmark::BenchmarkReporter {
public:
    std::map<std::string, std::vector<double>> times;
    bool ReportContext(const Context&) override { return true; }
    void ReportRuns(const std::vector<Run>& runs) override {
        for (const Run& run : runs)
            if (run.run_type == Run::RT_Iteration && !hasFailed(run, 0))
                times[run.run_name.function_name].push_back(run.GetAdjustedCPUTime() / 1000);
        std::cerr << '.' << std::flush;
    }
};

// `avx2` and `sse41` are the ratios that other runs have measured, with the kernels of those.
std::vector<Row> evaluate(const std::map<std::string, std::vector<double>>& times, const Ratios& avx2, const Ratios& sse41) {
    std::vector<Row> rows;
    for (const Line& line : lines()) {
        Row row{line.operation, line.size, "-", "", NAN, NAN, NAN, NAN, NAN};
        for (size_t i = 0; i < line.runs.size(); ++i) {
            const auto found = times.find(name(line, line.runs[i]));
            const double time = found == times.end() ? NAN : median(found->second);
            if (i == 0)
                row.kel = time;
            else if (line.runs[i].who == kBound)
                row.bound = time;
            else if (!(row.best <= time)) {
                row.best = time;
                row.peer = line.runs[i].who;
                row.differs = line.runs[i].differs;
            }
        }
        const auto ratioOf = [&](const Ratios& ratios) {
            const auto found = ratios.find({line.operation, line.size});
            return found == ratios.end() ? NAN : found->second;
        };
        row.avx2 = ratioOf(avx2);
        row.sse41 = ratioOf(sse41);
        if (!std::isnan(row.kel))
            rows.push_back(row);
    }
    return rows;
}

bool save(const std::string& path, const std::string& text) {
    std::ofstream out(path);
    out << text;
    out.flush();
    if (!out)
        std::cerr << "kel_bench: cannot write " << path << '\n';
    return static_cast<bool>(out);
}

} // namespace

void add(const std::string& operation, const std::string& size, Traffic traffic, std::vector<Run> runs) {
    if (traffic.read + traffic.written > 0)
        runs.push_back({kBound, [=] { return plainPass(traffic); }, ""});
    lines().push_back({operation, size, std::move(runs)});
}

Lines::Lines(void (*addLines)()) {
    adders().push_back(addLines);
}

namespace {

kel::Image render(int width, int height, int type) {
    kel::Image made(width, height, type);
    uint32_t state = 1;
    const int bytes = made->channels * made->depth;
    for (int i = 0; i < made->size; ++i) {
        state = state * 1664525u + 1013904223u;
        const int x = i / bytes % made->step, y = i / bytes / made->step;
        made->data[i] = static_cast<unsigned char>(128 + 60 * std::sin(x * 0.05) + 40 * std::cos(y * 0.07) + (state >> 28));
    }
    return made;
}

} // namespace

ImagePointer image(int width, int height, int type) {
    static std::map<std::tuple<int, int, int>, kel::Image> rendered; // once: a run asks for its images many times
    kel::Image& original = rendered[{width, height, type}];
    if (!original)
        original = render(width, height, type);
    const auto copy = std::make_shared<kel::Image>(original.clone());
    return ImagePointer(copy, copy->get());
}

} // namespace kel_bench

// Options of Google Benchmark (--benchmark_filter=REGEX, ...), --table=FILE, --picture=FILE and --csv=FILE; and --avx2=FILE and
// --sse41=FILE, which --csv has made of a run with the kernels of those instructions.
int main(int argc, char** argv) {
    using namespace kel_bench;
    std::map<std::string, std::string> path = {
        {"--table=", ""}, {"--picture=", ""}, {"--csv=", ""}, {"--avx2=", ""}, {"--sse41=", ""}};
    std::vector<char*> arguments;
    char interleave[] = "--benchmark_enable_random_interleaving=true", repetitions[] = "--benchmark_repetitions=7",
         minTime[] = "--benchmark_min_time=0.01";
    for (int i = 0; i < argc; ++i) {
        const std::string argument = argv[i];
        const size_t length = argument.find('=') + 1;
        const auto option = path.find(argument.substr(0, length));
        if (option != path.end())
            option->second = argument.substr(length);
        else
            arguments.push_back(argv[i]);
        if (i == 0)
            arguments.insert(arguments.end(), {interleave, repetitions, minTime}); // what the user gives comes later and counts
    }
    int count = static_cast<int>(arguments.size());
    benchmark::Initialize(&count, arguments.data());
    if (benchmark::ReportUnrecognizedArguments(count, arguments.data()))
        return 1;
#if KEL_BENCH_OPENCV
    cv::setNumThreads(1);
#endif
    for (void (*addLines)() : adders())
        addLines();
    std::stable_sort(lines().begin(), lines().end(), [](const Line& a, const Line& b) { return a.operation < b.operation; });
    for (const Line& line : lines())
        for (const Run& run : line.runs)
            benchmark::RegisterBenchmark(name(line, run).c_str(), [&run](benchmark::State& state) {
                const Body body = run.prepare();
                body(); // first touch of every page
                for (auto _ : state)
                    body();
            })->MeasureProcessCPUTime();
    Collector collector;
    benchmark::RunSpecifiedBenchmarks(&collector);
    std::cerr << '\n';
    if (collector.times.empty()) {
        std::cerr << "kel_bench: no benchmark has that name\n";
        return 1;
    }
    const std::vector<Row> rows = evaluate(collector.times, ratiosOf(path["--avx2="]), ratiosOf(path["--sse41="]));
    std::cout << table(rows);
    const auto saved = [&](const char* option, const std::string& text) {
        return path[option].empty() || save(path[option], text);
    };
    return saved("--table=", "# Performance\n\n![Every operation at 1920x1080](images/performance.svg)\n\n" + table(rows)) &&
                   saved("--picture=", picture(rows)) && saved("--csv=", csv(rows))
               ? 0
               : 1;
}
