// What Python passes in, checked, in kel's terms: every function of the module takes its arguments through these, and what they let
// pass breaks no precondition. Each throws TypeError or ValueError that opens with the argument's name.
#ifndef KEL_PYTHON_ARGUMENTS_H
#define KEL_PYTHON_ARGUMENTS_H

#include <cmath>
#include <cstdint>
#include <cstring>
#include <kel/kelImage.hpp>
#include <limits>
#include <memory>
#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>
#include <string>
#include <utility>
#include <vector>

namespace kelPython {

namespace py = pybind11;

[[noreturn]] inline void wrongType(const std::string& name, const std::string& what) {
    throw py::type_error(name + " must be " + what);
}
[[noreturn]] inline void wrongValue(const std::string& name, const std::string& what) {
    throw py::value_error(name + " must be " + what);
}

inline int integer(const py::handle& object, const char* name, long long low, long long high) {
    const py::object index = py::reinterpret_steal<py::object>(PyNumber_Index(object.ptr()));
    if (!index) {
        PyErr_Clear();
        wrongType(name, "an integer");
    }
    int overflow = 0;
    const long long value = PyLong_AsLongLongAndOverflow(index.ptr(), &overflow);
    if (overflow != 0 || value < low || value > high)
        wrongValue(name, std::to_string(low) + " to " + std::to_string(high));
    return static_cast<int>(value); // seed() passes all of 32 bits
}

inline float number(const py::handle& object, const char* name, double low, double high) {
    const double value = PyFloat_AsDouble(object.ptr());
    if (PyErr_Occurred()) {
        PyErr_Clear();
        wrongType(name, "a number");
    }
    if (!(value >= low && value <= high))
        wrongValue(name, py::str(py::float_(low)).cast<std::string>() + " to " + py::str(py::float_(high)).cast<std::string>());
    return static_cast<float>(value);
}

inline std::string text(const py::handle& object, const char* name) {
    if (!PyUnicode_Check(object.ptr()))
        wrongType(name, "a string");
    const char* const utf8 = PyUnicode_AsUTF8(object.ptr());
    if (!utf8) { // lone surrogates
        PyErr_Clear();
        wrongValue(name, "a known name");
    }
    return utf8;
}

/** (width, height) of a picture to be made. */
inline std::pair<int, int> extent(const py::handle& object, const char* name) {
    if (!PyTuple_Check(object.ptr()) && !PyList_Check(object.ptr()))
        wrongType(name, "a tuple (width, height)");
    const py::tuple both = py::reinterpret_borrow<py::object>(object);
    if (both.size() != 2)
        wrongValue(name, "a tuple (width, height)");
    return {integer(both[0], name, 1, INT32_MAX), integer(both[1], name, 1, INT32_MAX)};
}

/** The same numbers as doubles, row by row: `columns` in a row, and so many rows where `rows` is not 0. All are finite as float. */
inline std::vector<double> numbers(const py::handle& object, const char* name, py::ssize_t rows, py::ssize_t columns) {
    const std::string shape = (rows > 0 ? std::to_string(rows) : "N") + " x " + std::to_string(columns) + " numbers";
    const py::array given = py::array::ensure(object); // clears what it meets
    if (!given || !std::strchr("biuf", given.dtype().kind()))
        wrongType(name, shape);
    if (given.ndim() != 2 || given.shape(1) != columns || (rows > 0 && given.shape(0) != rows))
        wrongValue(name, shape);
    const auto values = py::array_t<double, py::array::c_style | py::array::forcecast>::ensure(given);
    if (!values)
        wrongType(name, shape);
    for (py::ssize_t i = 0; i < values.size(); ++i)
        if (!(std::abs(values.data()[i]) <= std::numeric_limits<float>::max()))
            wrongValue(name, "finite in single precision");
    return std::vector<double>(values.data(), values.data() + values.size());
}

/** A record over pixels of another's. */
class Header {
public:
    Header(int width, int height, int type, unsigned char* data) : m_image(createKelImageHeader(width, height, type)) {
        if (!m_image)
            throw std::bad_alloc();
        m_image->data = data;
        m_image->buffer = nullptr;
    }
    Header(const Header&) = delete;
    Header& operator=(const Header&) = delete;
    ~Header() { releaseKelImageHeader(&m_image); }
    kelImage_t* get() const { return m_image; }

private:
    kelImage_t* m_image;
};

/** An image of such a size, or ValueError that names the argument which asked for it. */
inline kel::Image make(long long width, long long height, int type, const char* name) {
    Header unit(1, 1, type, nullptr);
    const long long pixel = unit.get()->channels * unit.get()->depth;
    if (width < 1 || height < 1)
        wrongValue(name, "such that the result has pixels");
    if (width > INT32_MAX - 15 || height > INT32_MAX || (width + 15) / 16 * 16 * pixel > INT32_MAX / height)
        wrongValue(name, "such that the picture holds less than 2^31 bytes");
    return kel::Image(static_cast<int>(width), static_cast<int>(height), type);
}

constexpr const char* kPixels = "kel.pixels"; // names the capsules that own results

/** Hands an image to Python: an array over its pixels, rows `step` apart. `width` shows fewer columns, where that is not 0. */
inline py::array toArray(kel::Image image, int width = 0) {
    const bool wide = image->type == KEL_PIXEL_TYPE_S16G;
    std::vector<py::ssize_t> shape{image->height, width > 0 ? width : image->width};
    std::vector<py::ssize_t> strides{static_cast<py::ssize_t>(image->step) * image->channels * image->depth,
                                     static_cast<py::ssize_t>(image->channels) * image->depth};
    if (image->channels > 1) {
        shape.push_back(image->channels);
        strides.push_back(image->depth);
    }
    unsigned char* const data = image->data;
    const py::capsule owner(image.get(), kPixels, [](PyObject* capsule) {
        kelImage_t* made = static_cast<kelImage_t*>(PyCapsule_GetPointer(capsule, kPixels));
        releaseKelImage(&made);
    });
    image.release();
    return py::array(wide ? py::dtype::of<int16_t>() : py::dtype::of<uint8_t>(), shape, strides, data, owner);
}

enum Kinds { GreyOnly, WholePixels, AnyKind }; // one byte grey; all but UYVY; all

/**
 * An argument's pixels as an image. Where the array has kel's layout the image is its memory; load(), to be called without the GIL,
 * copies where it has not, and fills the padding with each row's last pixel.
 */
class Picture {
public:
    /** @param padded whether what lies behind the rows counts; @param dense whether rows must follow each other without a gap */
    Picture(const py::handle& object, const char* name, Kinds kinds, bool padded = false, bool dense = false) : m_dense(dense) {
        if (!py::isinstance<py::array>(object))
            wrongType(name, "a NumPy array");
        m_array = py::reinterpret_borrow<py::array>(object);
        setType(name, kinds);
        const py::ssize_t height = m_array.shape(0), width = m_array.shape(1);
        if (width < 1 || height < 1)
            wrongValue(name, "a picture with pixels");
        if (width > INT32_MAX - 15 || height > INT32_MAX || (width + 15) / 16 * 16 * pixel() > INT32_MAX / height)
            wrongValue(name, "smaller than 2^31 bytes");
        m_width = static_cast<int>(width);
        m_height = static_cast<int>(height);
        m_step = dense ? m_width : (m_width + 15) / 16 * 16;
        if (!isLaidOut(padded))
            m_own = kel::Image(m_width, m_height, m_type);
        m_header = std::make_unique<Header>(
            m_width, m_height, m_type, m_own ? m_own->data : static_cast<unsigned char*>(const_cast<void*>(m_array.data())));
    }

    void load() {
        if (!m_own)
            return;
        for (int y = 0; y < m_height; ++y) {
            unsigned char* const to = m_own->data + static_cast<size_t>(y) * m_step * pixel();
            loadRow(to, static_cast<const unsigned char*>(m_array.data()) + y * m_array.strides(0));
            if (!m_dense)
                fill(to);
        }
    }

    kelImage_t* get() const { return m_header->get(); }
    int width() const { return m_width; }
    int height() const { return m_height; }
    int step() const { return m_step; }
    int type() const { return m_type; }
    int pixel() const { return m_channels * m_depth; }
    const unsigned char* row(int y) const { return get()->data + static_cast<size_t>(y) * m_step * pixel(); }
    const py::array& array() const { return m_array; }

private:
    void setType(const char* name, Kinds kinds) {
        const py::dtype dtype = m_array.dtype();
        const bool wide = dtype.kind() == 'i' && dtype.itemsize() == 2, narrow = dtype.kind() == 'u' && dtype.itemsize() == 1;
        if (!narrow && !(wide && kinds != GreyOnly))
            wrongType(name, kinds == GreyOnly ? "of type uint8" : "of type uint8, or int16 for grey");
        if (wide && !dtype.attr("isnative").cast<bool>())
            wrongType(name, "of this machine's byte order");
        const py::ssize_t channels = m_array.ndim() == 2 ? 1 : m_array.ndim() == 3 ? m_array.shape(2) : 0;
        if (kinds == GreyOnly
                ? m_array.ndim() != 2
                : (channels < 1 || channels > 4 || (m_array.ndim() == 3 && channels == 1) || (wide && channels > 1)))
            wrongValue(name, kinds == GreyOnly ? "H x W" : "H x W, or of type uint8 and H x W x 2, 3 or 4");
        if (kinds == WholePixels && channels == 2)
            wrongValue(name, "no UYVY: convert it first");
        const int types[] = {KEL_PIXEL_TYPE_U8G, KEL_PIXEL_TYPE_U8YUV, KEL_PIXEL_TYPE_U8XYZ, KEL_PIXEL_TYPE_U8XYZA};
        m_type = wide ? KEL_PIXEL_TYPE_S16G : types[channels - 1];
        m_channels = static_cast<int>(channels);
        m_depth = wide ? 2 : 1;
    }

    // The last row's padding is memory that may be read only where kel made it.
    bool isLaidOut(bool padded) const {
        const bool gapless = m_array.strides(1) == pixel() && (m_channels == 1 || m_array.strides(2) == m_depth);
        const bool pitched = m_array.strides(0) == static_cast<py::ssize_t>(m_step) * pixel() || m_height == 1;
        const size_t alignment = m_channels == 4 ? 4 : static_cast<size_t>(m_depth);
        if (!gapless || !pitched || reinterpret_cast<uintptr_t>(m_array.data()) % alignment != 0)
            return false;
        return m_step == m_width || (!padded && !(m_type == KEL_PIXEL_TYPE_U8YUV && m_width % 2) && isResult());
    }
    bool isResult() const {
        const py::object base = m_array.base();
        if (!base || !PyCapsule_IsValid(base.ptr(), kPixels))
            return false;
        const kelImage_t* const made = static_cast<const kelImage_t*>(PyCapsule_GetPointer(base.ptr(), kPixels));
        return made->data == m_array.data() && made->step == m_step && made->height == m_height &&
               made->channels * made->depth == pixel();
    }

    void loadRow(unsigned char* to, const unsigned char* from) const {
        const py::ssize_t across = m_array.strides(1), deep = m_channels > 1 ? m_array.strides(2) : m_depth;
        if (across == pixel() && deep == m_depth) {
            std::memcpy(to, from, static_cast<size_t>(m_width) * pixel());
            return;
        }
        for (int x = 0; x < m_width; ++x)
            for (int c = 0; c < m_channels; ++c, to += m_depth)
                std::memcpy(to, from + x * across + c * deep, m_depth);
    }

    // A pair of UYVY that an odd width cuts takes the V of the pair before; without one there, none.
    void fill(unsigned char* row) const {
        unsigned char *to = row + static_cast<size_t>(m_width) * pixel(), *const end =
                                                                              row + static_cast<size_t>(m_step) * pixel();
        if (m_type == KEL_PIXEL_TYPE_U8YUV) {
            const unsigned char u = *(to - (m_width % 2 ? 2 : 4)), y = *(to - 1);
            const unsigned char v = m_width % 2 == 0 ? *(to - 2) : m_width > 1 ? *(to - 4) : 128;
            for (int x = m_width; x < m_step; ++x) {
                *to++ = x % 2 ? v : u;
                *to++ = y;
            }
            return;
        }
        for (const unsigned char* from = to - pixel(); to < end; ++to, ++from)
            *to = *from;
    }

    py::array m_array;
    bool m_dense;
    int m_type = 0, m_channels = 0, m_depth = 0, m_width = 0, m_height = 0, m_step = 0;
    kel::Image m_own;
    std::unique_ptr<Header> m_header;
};

} // namespace kelPython

#endif
