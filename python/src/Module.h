// The functions behind the Python package, each in its file; Module.cpp names them. Arguments are any objects: Arguments.h checks them.
#ifndef KEL_PYTHON_MODULE_H
#define KEL_PYTHON_MODULE_H

#include <pybind11/numpy.h>
#include <pybind11/pybind11.h>

namespace kelPython {

namespace py = pybind11;

struct Keypoint {
    float x, y;
    int score;
};

py::array convert(const py::object& image, const py::object& source, const py::object& target);
py::array stretchContrast(const py::object& grey);
py::array threshold(const py::object& grey, const py::object& t);
py::array adaptiveThreshold(const py::object& grey);
py::object gaussian(const py::object& grey, const py::object& size, bool withHalf);
py::array cross(const py::object& grey);
py::array sobel(const py::object& grey);
py::array rankFilter(const py::object& grey, const py::object& radius);
py::array addNoise(const py::object& grey, const py::object& amplitude);
py::array keypoints(const py::object& grey, const py::object& maximum, bool smoothed);
py::array resize(const py::object& image, const py::object& size, const py::object& method);
py::array halve(const py::object& image);
py::array addBorder(const py::object& image, const py::object& size);
py::array cropBorder(const py::object& image, const py::object& size);
py::array flip(const py::object& image, const py::object& direction);
py::array warp(const py::object& image, const py::object& homography, const py::object& size);

void seed(const py::object& n);
py::tuple findHomography(const py::object& src, const py::object& dst, const py::object& method, const py::object& threshold);
py::tuple findProjection(const py::object& points3d, const py::object& points2d, const py::object& method,
                         const py::object& threshold);
py::tuple decomposeCamera(const py::object& projection);

/** Adds Prepared, prepare, register, find_features and match_features. */
void addRegistration(py::module_& module);

} // namespace kelPython

#endif
