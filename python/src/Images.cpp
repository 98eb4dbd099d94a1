// The image half for Python: what kel leaves unwritten or takes from padding is defined here, so that pixels alone decide.
#include <algorithm>
#include <array>
#include <cstdlib>

#include "Arguments.h"
#include "Module.h"

namespace kelPython {

namespace {

constexpr int kWholeRatios = 1 << 23; // the most rows and columns of which positions are exact

struct Format {
    const char* name;
    int type;
};
constexpr Format kFormats[] = {{"GREY", KEL_PIXEL_TYPE_U8G},  {"GREY16", KEL_PIXEL_TYPE_S16G}, {"BGR", KEL_PIXEL_TYPE_U8XYZ},
                               {"RGB", KEL_PIXEL_TYPE_U8ZYX}, {"BGRA", KEL_PIXEL_TYPE_U8XYZA}, {"RGBA", KEL_PIXEL_TYPE_U8ZYXA},
                               {"UYVY", KEL_PIXEL_TYPE_U8YUV}};

int format(const py::handle& object, const char* name) {
    const std::string given = text(object, name);
    for (const Format& known : kFormats)
        if (given == known.name)
            return known.type;
    wrongValue(name, "GREY, GREY16, BGR, RGB, BGRA, RGBA or UYVY");
}

bool isFour(int type) {
    return type == KEL_PIXEL_TYPE_U8XYZA || type == KEL_PIXEL_TYPE_U8ZYXA;
}
bool isThree(int type) {
    return type == KEL_PIXEL_TYPE_U8XYZ || type == KEL_PIXEL_TYPE_U8ZYX;
}
bool isGrey(int type) {
    return type == KEL_PIXEL_TYPE_U8G || type == KEL_PIXEL_TYPE_S16G;
}

// The same pixels with the padding as pixels: kernels that go by blocks then have no row ends to treat in a way of their own.
Header whole(kelImage_t* image, int type) {
    return Header(image->step, image->height, type, image->data);
}
Header whole(kel::Image& image) {
    return whole(image.get(), image->type);
}

// Gives the pixels nearer to an edge than so many columns and rows what `from` has there, or zero.
void frame(kel::Image& image, int columns, int rows, const Picture* from = nullptr) {
    const int width = image->width, pixel = static_cast<int>(image.pixelBytes());
    const auto put = [&](int y, int begin, int end) {
        unsigned char* const to = image.row(y) + static_cast<ptrdiff_t>(begin) * pixel;
        const size_t bytes = static_cast<size_t>(end - begin) * pixel;
        if (from)
            std::memcpy(to, from->row(y) + static_cast<ptrdiff_t>(begin) * pixel, bytes);
        else
            std::memset(to, 0, bytes);
    };
    for (int y = 0; y < image->height; ++y)
        if (y < rows || y >= image->height - rows || width <= 2 * columns) {
            put(y, 0, width);
        } else {
            put(y, 0, columns);
            put(y, width - columns, width);
        }
}

// One way of convertKelImage() that is none of its traps.
void convertOnce(kelImage_t* dst, const kelImage_t* src) {
    if (isThree(src->type) && isFour(dst->type) && dst->type - src->type != KEL_PIXEL_TYPE_U8XYZA - KEL_PIXEL_TYPE_U8XYZ)
        convertKelImage_U8XYZ_to_U8ZYXA(dst, src);
    else
        convertKelImage(dst, src);
}

// Smooths all but a frame, which keeps the source's pixels.
void smooth(kel::Image& dst, kel::Image* half, int size, const Picture& src) {
    const bool small = size == 5;
    kel::Image scratch(src.step(), src.height(), small ? KEL_PIXEL_TYPE_S16G : KEL_PIXEL_TYPE_U8G);
    if (small) {
        applyKelFilterGaussian5X5_downsampling(dst.get(), half ? half->get() : nullptr, src.get(), scratch.get());
    } else {
        const Header from = whole(src.get(), src.type()), to = whole(dst);
        applyKelFilterGaussian7X7_downsampling(to.get(), half ? half->get() : nullptr, from.get(), scratch.get());
    }
    const int columns = small ? 2 : 8, rows = small ? 2 : 3;
    frame(dst, columns, rows, &src);
    for (int y = 0; half && y < (*half)->height; ++y)
        for (int x = 0; x < (*half)->width; ++x) {
            if (2 * x == columns && 2 * y >= rows && 2 * y < dst->height - rows) // on to the frame's other side
                x = std::max(x, (dst->width - columns + 1) / 2);
            if (x < (*half)->width)
                half->row(y)[x] = dst.row(2 * y)[2 * x];
        }
}

void respond(kel::Image& dst, kelImage_t* src) {
    const Header from = whole(src, src->type), to = whole(dst);
    applyKelFilterLaplacian3X3(to.get(), from.get());
    frame(dst, 8, 5);
}

template <class Apply> py::array derivative(const py::object& grey, int type, Apply apply) {
    Picture src(grey, "grey", GreyOnly);
    kel::Image dst = make(src.width(), src.height(), type, "grey");
    {
        const py::gil_scoped_release free;
        src.load();
        apply(dst, src);
    }
    return toArray(std::move(dst));
}

} // namespace

py::array convert(const py::object& image, const py::object& source, const py::object& target) {
    const int from = format(source, "source"), to = format(target, "target");
    Picture src(image, "image", AnyKind);
    Header asked(src.width(), src.height(), from, src.get()->data);
    if (asked.get()->channels != src.get()->channels || asked.get()->depth != src.get()->depth)
        wrongValue("image", "of the source's format");
    if (to == KEL_PIXEL_TYPE_U8YUV && from != to)
        wrongValue("target", "no UYVY, unless the source is");
    kel::Image dst = make(src.width(), src.height(), to, "image");
    const int between = isFour(from) && isGrey(to)                                  ? KEL_PIXEL_TYPE_U8XYZ
                        : from == KEL_PIXEL_TYPE_U8YUV && to == KEL_PIXEL_TYPE_S16G ? KEL_PIXEL_TYPE_U8G
                                                                                    : -1;
    kel::Image step = between < 0 ? kel::Image() : make(src.width(), src.height(), between, "image");
    {
        const py::gil_scoped_release free;
        src.load();
        const Header first = whole(src.get(), from), last = whole(dst);
        if (step) {
            const Header middle = whole(step);
            convertOnce(middle.get(), first.get());
            convertOnce(last.get(), middle.get());
        } else {
            convertOnce(last.get(), first.get());
        }
    }
    return toArray(std::move(dst));
}

py::array stretchContrast(const py::object& grey) {
    Picture src(grey, "grey", GreyOnly, true); // the range is that of whole rows
    kel::Image dst = make(src.width(), src.height(), KEL_PIXEL_TYPE_U8G, "grey");
    {
        const py::gil_scoped_release free;
        src.load();
        adjustKelImage(dst.get(), src.get());
    }
    return toArray(std::move(dst));
}

py::array threshold(const py::object& grey, const py::object& t) {
    const int value = integer(t, "t", 0, 255);
    return derivative(grey, KEL_PIXEL_TYPE_U8G,
                      [=](kel::Image& dst, const Picture& src) { binalizeKelImage(dst.get(), src.get(), value); });
}

py::array adaptiveThreshold(const py::object& grey) {
    return derivative(grey, KEL_PIXEL_TYPE_U8G, [](kel::Image& dst, const Picture& src) {
        kel::Image scratch(src.step(), src.height(), KEL_PIXEL_TYPE_U8G);
        const Header from = whole(src.get(), src.type()), to = whole(dst);
        binalizeKelImageAdaptive(to.get(), from.get(), scratch.get());
        frame(dst, 16, 16);
    });
}

py::object gaussian(const py::object& grey, const py::object& size, bool withHalf) {
    const int taps = integer(size, "size", 5, 7);
    if (taps == 6)
        wrongValue("size", "5 or 7");
    Picture src(grey, "grey", GreyOnly);
    kel::Image dst = make(src.width(), src.height(), KEL_PIXEL_TYPE_U8G, "grey"), half;
    if (withHalf)
        half = make((src.width() + 1) / 2, (src.height() + 1) / 2, KEL_PIXEL_TYPE_U8G, "grey");
    {
        const py::gil_scoped_release free;
        src.load();
        smooth(dst, withHalf ? &half : nullptr, taps, src);
    }
    if (!withHalf)
        return toArray(std::move(dst));
    const py::array full = toArray(std::move(dst));
    return py::make_tuple(full, toArray(std::move(half)));
}

py::array cross(const py::object& grey) {
    return derivative(grey, KEL_PIXEL_TYPE_S16G, [](kel::Image& dst, const Picture& src) { respond(dst, src.get()); });
}

py::array sobel(const py::object& grey) {
    return derivative(grey, KEL_PIXEL_TYPE_S16G, [](kel::Image& dst, const Picture& src) {
        const Header from = whole(src.get(), src.type()), to = whole(dst);
        applyKelFilterSobel3X3(to.get(), from.get());
        frame(dst, 16, 1);
    });
}

py::array rankFilter(const py::object& grey, const py::object& radius) {
    const int n = integer(radius, "radius", 1, INT32_MAX);
    return derivative(grey, KEL_PIXEL_TYPE_U8G, [=](kel::Image& dst, const Picture& src) {
        if (n > (std::min(src.width(), src.height()) - 1) / 2)
            clearKelImage(dst.get()); // no window fits; it would be allocated all the same
        else
            applyKelFilterMedianNXN(dst.get(), src.get(), n);
    });
}

py::array addNoise(const py::object& grey, const py::object& amplitude) {
    const int most = integer(amplitude, "amplitude", 0, 1000000);
    return derivative(grey, KEL_PIXEL_TYPE_U8G,
                      [=](kel::Image& dst, const Picture& src) { applyKelFilterNoise(dst.get(), src.get(), most); });
}

py::array keypoints(const py::object& grey, const py::object& maximum, bool smoothed) {
    const int most = integer(maximum, "maximum", 0, INT32_MAX);
    Picture src(grey, "grey", GreyOnly);
    kel::Image blurred, response = make(src.width(), src.height(), KEL_PIXEL_TYPE_S16G, "grey");
    if (smoothed)
        blurred = make(src.width(), src.height(), KEL_PIXEL_TYPE_U8G, "grey");
    // Extrema are never neighbours.
    const long long room = std::min<long long>(most, (src.width() / 2 + 1LL) * (src.height() / 2 + 1));
    const std::unique_ptr<kelKeypoint2DF32_t[]> found(new kelKeypoint2DF32_t[static_cast<size_t>(room)]);
    int count = 0;
    {
        const py::gil_scoped_release free;
        src.load();
        if (smoothed)
            smooth(blurred, nullptr, 7, src);
        kelImage_t* const from = smoothed ? blurred.get() : src.get();
        respond(response, from);
        count = applyKelDetectorKeypointYape(found.get(), static_cast<int>(room), from, response.get());
    }
    py::array_t<Keypoint> result(std::min<py::ssize_t>(count, room));
    for (py::ssize_t i = 0; i < result.size(); ++i)
        result.mutable_data()[i] = {found[i].x, found[i].y, found[i].score};
    return result;
}

namespace {

// Behind rows that follow each other without a gap, `more` columns and rows that repeat the last: enlargement reads past the edge.
kel::Image extended(const Header& src, int moreColumns, int moreRows) {
    const int width = src.get()->width, height = src.get()->height, wide = width + moreColumns;
    kel::Image made =
        make(wide, height + moreRows + 1LL, src.get()->type, "size"); // a row more: the pixel behind the last is read, too
    const auto* const from = reinterpret_cast<const uint32_t*>(src.get()->data);
    auto* to = reinterpret_cast<uint32_t*>(made->data);
    for (int y = 0; y <= height + moreRows; ++y, to += wide) {
        const uint32_t* const row = from + static_cast<ptrdiff_t>(std::min(y, height - 1)) * width;
        std::fill(std::copy(row, row + width, to), to + wide, row[width - 1]);
    }
    return made;
}

int gcd(int a, int b) {
    return b == 0 ? a : gcd(b, a % b);
}

// An enlarged image, densely packed like its source: by an edge that is repeated at the same ratio, and then cut off.
kel::Image enlarged(const Header& src, int width, int height) {
    const int w = src.get()->width, h = src.get()->height, byX = gcd(w, width), byY = gcd(h, height);
    kel::Image room = extended(src, w / byX, h / byY);
    const Header from(room->width, room->height - 1, room->type, room->data);
    kel::Image big = make(static_cast<long long>(width) + width / byX, static_cast<long long>(height) + height / byY,
                          src.get()->type, "size");
    resizeLinerInterpolation(big.get(), from.get());
    kel::Image dst = make(width, height, src.get()->type, "size");
    for (int y = 0; y < height; ++y)
        std::memcpy(dst->data + static_cast<ptrdiff_t>(y) * width * 4, big->data + static_cast<ptrdiff_t>(y) * big->width * 4,
                    static_cast<size_t>(width) * 4);
    return dst;
}

// Densely packed pixels as an image with rows a step apart, in place: from the last row on.
void spread(kel::Image& image) {
    const size_t row = static_cast<size_t>(image->width) * image.pixelBytes();
    for (int y = image->height - 1; y > 0 && image->step != image->width; --y)
        std::memmove(image.row(y), image->data + y * row, row);
}

kel::Image resizeSmoothly(Picture& src, int width, int height) {
    const int w = src.width(), h = src.height(), kind = src.type();
    kel::Image four, reduced;
    if (src.pixel() != 4) { // grey and three channels by way of four
        four = make(w, h, KEL_PIXEL_TYPE_U8XYZA, "image");
        convertKelImage(four.get(), src.get());
        for (int y = 1; y < h && four->step != w; ++y)
            std::memmove(four->data + static_cast<ptrdiff_t>(y) * w * 4, four.row(y), static_cast<size_t>(w) * 4);
    }
    const Header from(w, h, KEL_PIXEL_TYPE_U8XYZA, four ? four->data : src.get()->data);
    reduced = make(std::min(w, width), std::min(h, height), KEL_PIXEL_TYPE_U8XYZA, "size");
    zero_order_hold_plus_ave(reduced.get(), from.get());
    kel::Image result = std::move(reduced);
    if (width > w || height > h) {
        kel::Image grown = enlarged(Header(result->width, result->height, result->type, result->data), width, height);
        result.swap(grown);
    }
    spread(result);
    if (src.pixel() == 4)
        return result;
    kel::Image three = make(width, height, KEL_PIXEL_TYPE_U8XYZ, "size");
    convertKelImage(three.get(), result.get());
    if (kind == KEL_PIXEL_TYPE_U8XYZ)
        return three;
    kel::Image grey = make(width, height, kind, "size");
    convertKelImage(grey.get(), three.get());
    return grey;
}

} // namespace

py::array resize(const py::object& image, const py::object& size, const py::object& method) {
    const std::string how = text(method, "method");
    if (how != "smooth" && how != "nearest" && how != "bilinear")
        wrongValue("method", "smooth, nearest or bilinear");
    const std::pair<int, int> wanted = extent(size, "size");
    const bool smoothly = how == "smooth", fourBytes = smoothly && py::isinstance<py::array>(image) &&
                                                       image.cast<py::array>().ndim() == 3 &&
                                                       image.cast<py::array>().shape(2) == 4;
    Picture src(image, "image", how == "bilinear" ? GreyOnly : WholePixels, false, !smoothly || fourBytes);
    kel::Image dst = make(wanted.first, wanted.second, src.type(), "size");
    if (smoothly && src.type() == KEL_PIXEL_TYPE_S16G)
        wrongType("image", "of type uint8 for method smooth");
    if (!smoothly && (src.width() % wanted.first || src.height() % wanted.second))
        wrongValue("size", "the picture's size divided by whole numbers, or method smooth");
    if (!smoothly && (src.width() >= kWholeRatios || src.height() >= kWholeRatios))
        wrongValue("image", "smaller than 2^23 rows and columns");
    {
        const py::gil_scoped_release free;
        src.load();
        if (smoothly) {
            dst = resizeSmoothly(src, wanted.first, wanted.second);
        } else {
            (how == "nearest" ? resizeKelImageNearest : resizeKelImageBilinear)(dst.get(), src.get());
            spread(dst);
        }
    }
    return toArray(std::move(dst));
}

py::array halve(const py::object& image) {
    Picture src(image, "image", WholePixels);
    kel::Image dst = make(src.width() / 2, src.height() / 2, src.type(), "image");
    {
        const py::gil_scoped_release free;
        src.load();
        resizeKelImageHalf(dst.get(), src.get());
    }
    return toArray(std::move(dst));
}

py::array addBorder(const py::object& image, const py::object& size) {
    const int border = integer(size, "size", 0, INT32_MAX / 4);
    const bool dense = py::isinstance<py::array>(image) && image.cast<py::array>().ndim() == 3;
    Picture src(image, "image", WholePixels, true, dense);
    const bool wide =
        src.type() == KEL_PIXEL_TYPE_S16G; // its right border starts at the step: the padding repeats the edge up to there
    kel::Image dst = make((wide ? src.step() : src.width()) + 2LL * border, src.height() + 2LL * border, src.type(), "size");
    {
        const py::gil_scoped_release free;
        src.load();
        const Header from(wide ? src.step() : src.width(), src.height(), src.type(), src.get()->data);
        resizeKelImageEnborder(dst.get(), from.get(), border);
        if (dense)
            spread(dst);
    }
    return toArray(std::move(dst), src.width() + 2 * border);
}

py::array cropBorder(const py::object& image, const py::object& size) {
    const int border = integer(size, "size", 0, INT32_MAX / 4);
    Picture src(image, "image", WholePixels);
    kel::Image dst = make(src.width() - 2LL * border, src.height() - 2LL * border, src.type(), "size");
    {
        const py::gil_scoped_release free;
        src.load();
        resizeKelImageDeborder(dst.get(), src.get(), border);
    }
    return toArray(std::move(dst));
}

py::array flip(const py::object& image, const py::object& direction) {
    const std::string how = text(direction, "direction");
    const auto turn = how == "horizontal" ? rotateKelImageH : how == "vertical" ? rotateKelImageV : rotateKelImageVH;
    if (how != "horizontal" && how != "vertical" && how != "both")
        wrongValue("direction", "horizontal, vertical or both");
    Picture src(image, "image", WholePixels);
    kel::Image dst = make(src.width(), src.height(), src.type(), "image");
    {
        const py::gil_scoped_release free;
        src.load();
        turn(dst.get(), src.get());
    }
    return toArray(std::move(dst));
}

namespace {

// The inverse of a homography as kel takes it, or false. `shift` moves the origin from the first pixel's centre to its corner.
bool inverseOf(const std::vector<double>& h, double shift, float inverse[9]) {
    double m[9];
    for (int i = 0; i < 9; ++i) {
        const int r = i / 3, c = i % 3, r1 = (c + 1) % 3, r2 = (c + 2) % 3, c1 = (r + 1) % 3, c2 = (r + 2) % 3;
        m[i] = h[r1 * 3 + c1] * h[r2 * 3 + c2] - h[r1 * 3 + c2] * h[r2 * 3 + c1]; // the adjugate
    }
    const double determinant = h[0] * m[0] + h[1] * m[3] + h[2] * m[6];
    double greatest = 0;
    for (int r = 0; r < 3; ++r)
        m[r * 3 + 2] -= shift * (m[r * 3] + m[r * 3 + 1]);
    for (int i = 0; i < 6; ++i)
        m[i] += shift * m[6 + i % 3];
    for (const double value : m)
        greatest = std::max(greatest, std::abs(value));
    if (!std::isfinite(determinant) || determinant == 0 || !std::isfinite(greatest) || greatest == 0)
        return false;
    const double scale = std::abs(m[8]) > greatest * 1e-12 ? m[8] : greatest;
    for (int i = 0; i < 9; ++i)
        inverse[i] = static_cast<float>(m[i] / scale);
    return std::all_of(inverse, inverse + 9, [](float value) { return std::isfinite(value); });
}

// Zero where nothing maps to but kel, truncating toward zero, repeats the first column or row: where a quotient is negative. Along a row
// the signs change at three places at most; what is near one is looked at pixel by pixel.
void clearBefore(kel::Image& dst, const float h[9], float half) {
    const size_t pixel = dst.pixelBytes();
    const int width = dst->width;
    const float corner = half > 0 ? 0 : 0.5f; // added to the quotients where it is not in the homography
    for (int y = 0; y < dst->height; ++y) {
        const float v = static_cast<float>(y) + half;
        const auto isBefore = [&](int x) {
            const float u = static_cast<float>(x) + half, w = h[6] * u + h[7] * v + h[8];
            return (h[0] * u + h[1] * v + h[2]) / w + corner < 0 || (h[3] * u + h[4] * v + h[5]) / w + corner < 0;
        };
        const double dw = h[7] * double(v) + h[8];
        const double slopes[] = {h[0] + corner * double(h[6]), h[3] + corner * double(h[6]), h[6]};
        const double offsets[] = {h[1] * double(v) + h[2] + corner * dw, h[4] * double(v) + h[5] + corner * dw, dw};
        int places[] = {0, width, width, width, width, width, width, width};
        for (int i = 0; i < 3; ++i)
            if (slopes[i] != 0) {
                const double root = std::min(std::max(-offsets[i] / slopes[i] - half, -4.0), width + 4.0);
                places[1 + 2 * i] = std::min(std::max(static_cast<int>(root) - 1, 0), width);
                places[2 + 2 * i] = std::min(std::max(static_cast<int>(root) + 3, 0), width);
            }
        std::sort(places, places + 8);
        for (int i = 0; i < 7; ++i) {
            const int begin = places[i], end = places[i + 1];
            if (end - begin > 4) {
                if (isBefore(begin + (end - begin) / 2))
                    std::memset(dst.row(y) + begin * pixel, 0, static_cast<size_t>(end - begin) * pixel);
                continue;
            }
            for (int x = begin; x < end; ++x)
                if (isBefore(x))
                    std::memset(dst.row(y) + x * pixel, 0, pixel);
        }
    }
}

} // namespace

py::array warp(const py::object& image, const py::object& homography, const py::object& size) {
    const std::vector<double> forward = numbers(homography, "homography", 3, 3);
    const std::pair<int, int> wanted = extent(size, "size");
    Picture src(image, "image", WholePixels);
    kel::Image dst = make(wanted.first, wanted.second, src.type(), "size");
    float h[9];
    const float half = src.type() == KEL_PIXEL_TYPE_U8G ? 0.5f : 0;
    if (!inverseOf(forward, half, h))
        wrongValue("homography", "such that it has an inverse");
    {
        const py::gil_scoped_release free;
        src.load();
        rotateKelImageHomography(dst.get(), src.get(), h[0], h[1], h[2], h[3], h[4], h[5], h[6], h[7], h[8]);
        clearBefore(dst, h, half);
    }
    return toArray(std::move(dst));
}

} // namespace kelPython
