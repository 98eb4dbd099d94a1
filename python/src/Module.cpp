// kel._kel, the compiled part of the Python package: functions that take any objects and check them. Their names, defaults, hints and
// documentation are those of kel/__init__.py.
#include <kel/kelImage.h>

#include "Module.h"

PYBIND11_MODULE(_kel, module) {
    using namespace kelPython;
    PYBIND11_NUMPY_DTYPE(Keypoint, x, y, score);
    module.attr("version") = KEL_VERSION;
    module.attr("KEYPOINT") = py::dtype::of<Keypoint>();
    module.def("convert", convert);
    module.def("stretch_contrast", stretchContrast);
    module.def("threshold", threshold);
    module.def("adaptive_threshold", adaptiveThreshold);
    module.def("gaussian", gaussian);
    module.def("cross", cross);
    module.def("sobel", sobel);
    module.def("rank_filter", rankFilter);
    module.def("add_noise", addNoise);
    module.def("keypoints", keypoints);
    module.def("resize", resize);
    module.def("halve", halve);
    module.def("add_border", addBorder);
    module.def("crop_border", cropBorder);
    module.def("flip", flip);
    module.def("warp", warp);
    module.def("seed", seed);
    module.def("find_homography", findHomography);
    module.def("find_projection", findProjection);
    module.def("decompose_camera", decomposeCamera);
    addRegistration(module);
}
