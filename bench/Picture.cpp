// The picture of the table: a row an operation, on a logarithmic scale of kel's time over that of the best peer.
#include "Table.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <sstream>

namespace kel_bench {

namespace {

constexpr double kLeft = 330, kRight = 890, kWidth = 1010, kTop = 76, kRow = 17; // of the plot, in pixels
constexpr double kLeast = 1. / 16, kGreatest = 8;
const char *const kAhead = "#1f6feb", *const kBehind = "#c2410c", *const kQuiet = "#57606a", *const kRule = "#d0d7de";

double at(double ratio) {
    const double place = std::log(ratio / kLeast) / std::log(kGreatest / kLeast);
    return kLeft + (kRight - kLeft) * std::min(std::max(place, 0.), 1.);
}

std::string fixed(double value, int digits) {
    char text[32];
    std::snprintf(text, sizeof text, "%.*f", digits, value);
    return text;
}

std::string text(double x, double y, const char* anchor, const char* colour, const std::string& words) {
    return "<text x='" + fixed(x, 1) + "' y='" + fixed(y, 1) + "' text-anchor='" + anchor + "' fill='" + colour + "'>" + words +
           "</text>\n";
}

std::string circle(double x, double y, double radius, const std::string& paint) {
    return "<circle cx='" + fixed(x, 1) + "' cy='" + fixed(y, 1) + "' r='" + fixed(radius, 1) + "' " + paint + "/>\n";
}

std::string rule(double x, double top, double bottom, const std::string& paint) {
    return "<path d='M" + fixed(x, 1) + " " + fixed(top, 1) + "V" + fixed(bottom, 1) + "' " + paint + "/>\n";
}

// The marks of one row: SSE4.1 as a tick, AVX2 as a ring, the full width as a disc that a bar joins with 1.
std::string marks(const Row& row, double y) {
    const char* const colour = row.ratio() > 1 ? kBehind : kAhead;
    std::string marks = "<path d='M" + fixed(at(1), 1) + " " + fixed(y, 1) + "H" + fixed(at(row.ratio()), 1) + "' stroke='" +
                        colour + "' stroke-width='5'/>\n";
    if (!std::isnan(row.sse41))
        marks += rule(at(row.sse41), y - 4, y + 4, std::string("stroke='") + kQuiet + "' stroke-width='1.5'");
    if (!std::isnan(row.avx2))
        marks += circle(at(row.avx2), y, 3.2, std::string("fill='#fff' stroke='") + kQuiet + "' stroke-width='1.5'");
    return marks + circle(at(row.ratio()), y, 4.5, std::string("fill='") + colour + "'");
}

} // namespace

std::string picture(const std::vector<Row>& rows) {
    std::vector<Row> shown;
    std::copy_if(rows.begin(), rows.end(), std::back_inserter(shown),
                 [](const Row& row) { return row.size == "1920x1080" && !std::isnan(row.ratio()); });
    std::stable_sort(shown.begin(), shown.end(), [](const Row& a, const Row& b) { return a.ratio() < b.ratio(); });
    const double bottom = kTop + kRow * static_cast<double>(shown.size());
    std::ostringstream out;
    out << "<svg xmlns='http://www.w3.org/2000/svg' width='" << kWidth << "' height='" << bottom + 12
        << "' font-family='sans-serif' font-size='11'>\n<rect width='100%' height='100%' fill='#fff'/>\n"
        << "<g font-size='14'>"
        << text(12, 22, "start", "#1f2328", "Time of kel / time of the fastest peer, images of 1920x1080") << "</g>\n"
        << text(12, 40, "start", kQuiet, "disc: kel as it runs there; ring: its kernels for AVX2; tick: its kernels for SSE4.1")
        << text(at(1) - 8, 50, "end", kAhead, "kel is faster") << text(at(1) + 8, 50, "start", kBehind, "kel is slower");
    for (double ratio = kLeast; ratio <= kGreatest; ratio *= 2)
        out << rule(at(ratio), kTop - 6, bottom, std::string("stroke='") + kRule + "'")
            << text(at(ratio), kTop - 26 + (ratio == 1 ? 0 : 12), "middle", kQuiet,
                    ratio < 1 ? "1/" + fixed(1 / ratio, 0) : fixed(ratio, 0));
    out << rule(at(1), kTop - 20, bottom, "stroke='#1f2328'");
    double y = kTop + kRow / 2;
    for (const Row& row : shown) {
        out << text(kLeft - 10, y + 4, "end", "#1f2328", row.operation) << marks(row, y)
            << text(kRight + 12, y + 4, "start", row.ratio() > 1 ? kBehind : kAhead, fixed(row.ratio(), 2) + " " + row.peer);
        y += kRow;
    }
    out << "</svg>\n";
    return out.str();
}

} // namespace kel_bench
