// The geometry half for Python: robust and algebraic fits, and the decomposition of a camera.
#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <kel/kelMat.h>
#include <mutex>

#include "Arguments.h"
#include "Module.h"

namespace kelPython {

namespace {

py::array_t<double> toArray(const kelMat& matrix) {
    py::array_t<double> array({matrix.m_Height, matrix.m_Width});
    std::copy(matrix.m_Data, matrix.m_Data + array.size(), array.mutable_data());
    return array;
}

bool isFinite(const kelMat& matrix) {
    return std::all_of(matrix.m_Data, matrix.m_Data + matrix.m_Height * matrix.m_Width,
                       [](float v) { return std::isfinite(v); });
}

enum Method { Ransac, LeastSquares, Taubin };

Method method(const py::handle& object) {
    const std::string name = text(object, "method");
    if (name == "ransac")
        return Ransac;
    if (name == "lsm")
        return LeastSquares;
    if (name == "taubin")
        return Taubin;
    wrongValue("method", "ransac, lsm or taubin");
}

// Taubin's fit of a projection prints its matrices. In a program of Python's they would be noise: what is printed meanwhile is dropped.
template <class Fit> bool silently(Fit fit) {
    static std::mutex one;
    const std::lock_guard<std::mutex> lock(one);
    FILE *const nowhere = std::fopen("/dev/null", "w"), *const before = stdout;
    if (nowhere)
        stdout = nowhere;
    const bool result = fit();
    stdout = before;
    if (nowhere)
        std::fclose(nowhere);
    return result;
}

bool estimate(kelMatEstimatorH& H, kelMatCorrespH& c, Method how, float threshold) {
    if (c.m_Num == 4) // no fit of many, but there is just one answer
        return H.estimate_by4P(c.m_SrcX[0], c.m_SrcY[0], c.m_DstX[0], c.m_DstY[0], c.m_SrcX[1], c.m_SrcY[1], c.m_DstX[1],
                               c.m_DstY[1], c.m_SrcX[2], c.m_SrcY[2], c.m_DstX[2], c.m_DstY[2], c.m_SrcX[3], c.m_SrcY[3],
                               c.m_DstX[3], c.m_DstY[3]);
    const bool result = how == Ransac         ? H.estimate_byRANSAC_fine(c, threshold, nullptr)
                        : how == LeastSquares ? H.estimate_byLSM_fine(c)
                                              : H.estimate_byTaubin(c);
    H.setDataUnitize(); // Taubin's scale is its own
    return result;
}
bool estimate(kelMatEstimatorP& P, kelMatCorrespP& c, Method how, float threshold) {
    return how == Ransac         ? P.estimate_byRANSAC_fine(c, threshold)
           : how == LeastSquares ? P.estimate_byLSM_fine(c)
                                 : silently([&] { return P.estimate_byTaubin(c); });
}

void add(kelMatCorrespH& c, const double* a, const double* b) {
    c.add(static_cast<float>(a[0]), static_cast<float>(a[1]), static_cast<float>(b[0]), static_cast<float>(b[1]));
}
void add(kelMatCorrespP& c, const double* a, const double* b) {
    c.add(static_cast<float>(a[0]), static_cast<float>(a[1]), static_cast<float>(a[2]), static_cast<float>(b[0]),
          static_cast<float>(b[1]));
}

// Either fit: pairs of points of so many coordinates, at least `least` of them.
template <class Estimator, class Pairs>
py::tuple find(const py::handle& first, const char* firstName, int coordinates, const py::handle& second,
               const char* secondName, size_t least, const py::handle& howName, const py::handle& within) {
    const std::vector<double> from = numbers(first, firstName, 0, coordinates), to = numbers(second, secondName, 0, 2);
    const Method how = method(howName);
    const float threshold = number(within, "threshold", 1e-6, 1e6);
    const size_t count = from.size() / coordinates;
    if (count < least || count > KEL_CORRESP_MAX)
        wrongValue(firstName, std::to_string(least) + " to " + std::to_string(int(KEL_CORRESP_MAX)) + " points");
    if (to.size() / 2 != count)
        wrongValue(secondName, std::string("as many points as ") + firstName);
    Pairs pairs;
    for (size_t i = 0; i < count; ++i)
        add(pairs, &from[i * coordinates], &to[2 * i]);
    Estimator estimator;
    std::vector<bool> inliers(count);
    bool found = false;
    {
        const py::gil_scoped_release free;
        found = estimate(estimator, pairs, how, threshold) && isFinite(estimator);
        if (found)
            judgeInliers(estimator, pairs, inliers, threshold);
    }
    if (!found)
        throw std::runtime_error("no fit to these pairs");
    py::array_t<bool> mask(static_cast<py::ssize_t>(count));
    std::copy(inliers.begin(), inliers.end(), mask.mutable_data());
    return py::make_tuple(toArray(estimator), mask);
}

} // namespace

void seed(const py::object& n) {
    srand(static_cast<unsigned>(integer(n, "n", 0, UINT32_MAX)));
}

py::tuple findHomography(const py::object& src, const py::object& dst, const py::object& method, const py::object& threshold) {
    return find<kelMatEstimatorH, kelMatCorrespH>(src, "src", 2, dst, "dst", 4, method, threshold);
}

py::tuple findProjection(const py::object& points3d, const py::object& points2d, const py::object& method,
                         const py::object& threshold) {
    return find<kelMatEstimatorP, kelMatCorrespP>(points3d, "points3d", 3, points2d, "points2d", 6, method, threshold);
}

py::tuple decomposeCamera(const py::object& projection) {
    const std::vector<double> values = numbers(projection, "P", 3, 4);
    kelMat P(3, 4), K, R, t;
    std::copy(values.begin(), values.end(), P.m_Data);
    P.getDecomposedMatrix_ART_3x4(K, R, t);
    if (!isFinite(K) || !isFinite(R) || !isFinite(t))
        wrongValue("P", "a camera: its left 3 x 3 part has no inverse");
    return py::make_tuple(toArray(K), toArray(R), toArray(t).reshape({3}));
}

} // namespace kelPython
