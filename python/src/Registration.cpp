// Registration for Python: pictures made ready once, features, and the whole of it.
#include <chrono>
#include <kel/kelRegister.h>

#include "Arguments.h"
#include "Module.h"

namespace kelPython {

namespace {

using kelRegister::Feature;
using kelRegister::Options;
using kelRegister::Prepared;
using kelRegister::Result;

Options options(const py::handle& threshold, const py::handle& features, const py::handle& workingSize, bool views) {
    Options made;
    made.threshold = number(threshold, "threshold", 0.1, 100);
    made.mostFeatures = integer(features, "features", 50, 5000);
    made.workingSize = integer(workingSize, "working_size", 200, 8000);
    made.views = views;
    return made;
}

template <class T> py::array_t<T> toArray(const std::vector<T>& values) {
    return py::array_t<T>(static_cast<py::ssize_t>(values.size()), values.data());
}

std::vector<Feature> features(const py::handle& object, const char* name) {
    if (!py::isinstance<py::array>(object) ||
        !py::reinterpret_borrow<py::array>(object).dtype().equal(py::dtype::of<Feature>()) ||
        py::reinterpret_borrow<py::array>(object).ndim() != 1)
        wrongType(name, "an array of find_features()");
    const auto values = py::array_t<Feature, py::array::c_style | py::array::forcecast>::ensure(object);
    if (!values || values.size() > 100000)
        wrongValue(name, "100000 features or less");
    return std::vector<Feature>(values.data(), values.data() + values.size());
}

std::unique_ptr<Prepared> prepare(const py::handle& image, const char* name, const Options& with) {
    Picture picture(image, name, AnyKind);
    std::unique_ptr<Prepared> made;
    {
        const py::gil_scoped_release free;
        picture.load();
        made = std::make_unique<Prepared>(picture.get(), with);
    }
    return made;
}

// Two columns of places and a flag; structures of Python's side name them.
struct Pair {
    int first, second;
    float x1, y1, x2, y2;
    bool inlier;
};

py::dict toDict(const Result& result, double seconds) {
    py::dict all;
    py::array_t<double> H({3, 3});
    if (result.found)
        std::copy(result.H.m_Data, result.H.m_Data + 9, H.mutable_data());
    std::vector<Pair> pairs;
    for (const kelRegister::Match& m : result.matches) {
        const Feature &a = result.first[m.first], &b = result.second[m.second];
        pairs.push_back({m.first, m.second, a.x, a.y, b.x, b.y, m.inlier});
    }
    all["found"] = result.found;
    all["reason"] = result.reason;
    all["homography"] = H;
    all["agreement"] = static_cast<double>(result.share);
    all["tested"] = result.tested;
    all["agreeing"] = result.agreeing;
    all["expected_error"] = static_cast<double>(result.expectedError);
    all["matches"] = toArray(pairs);
    all["keypoints"] = py::make_tuple(toArray(result.first), toArray(result.second));
    all["elapsed"] = seconds;
    return all;
}

py::dict registerTwo(const py::object& first, const py::object& second, const py::object& threshold,
                     const py::object& mostFeatures, const py::object& workingSize, bool views) {
    const Options with = options(threshold, mostFeatures, workingSize, views);
    const auto start = std::chrono::steady_clock::now();
    const bool ready[] = {py::isinstance<Prepared>(first), py::isinstance<Prepared>(second)};
    std::unique_ptr<Picture> pictures[2];
    for (int i : {0, 1})
        if (!ready[i])
            pictures[i] = std::make_unique<Picture>(i ? second : first, i ? "second" : "first", AnyKind);
    const Prepared* const given[] = {ready[0] ? &first.cast<const Prepared&>() : nullptr,
                                     ready[1] ? &second.cast<const Prepared&>() : nullptr};
    Result result;
    {
        const py::gil_scoped_release free;
        for (const auto& picture : pictures)
            if (picture)
                picture->load();
        if (ready[0] && ready[1])
            result = registerPictures(*given[0], *given[1], with);
        else if (ready[0])
            result = registerPictures(*given[0], Prepared(pictures[1]->get(), with), with);
        else if (ready[1])
            result = registerPictures(Prepared(pictures[0]->get(), with), *given[1], with);
        else
            result = kelRegister::registerPictures(pictures[0]->get(), pictures[1]->get(), with);
    }
    return toDict(result, std::chrono::duration<double>(std::chrono::steady_clock::now() - start).count());
}

py::array findFeatures(const py::object& image, const py::object& mostFeatures, const py::object& workingSize) {
    const Options with = options(py::int_(3), mostFeatures, workingSize, true);
    Picture picture(image, "image", AnyKind);
    std::vector<Feature> found;
    std::string reason;
    {
        const py::gil_scoped_release free;
        picture.load();
        found = kelRegister::findFeatures(picture.get(), with, &reason);
    }
    if (!reason.empty())
        throw py::value_error("image: " + reason);
    return toArray(found);
}

py::array matchFeatures(const py::object& first, const py::object& second) {
    const std::vector<Feature> a = features(first, "first"), b = features(second, "second");
    std::vector<Pair> pairs;
    {
        const py::gil_scoped_release free;
        for (const kelRegister::Match& m : kelRegister::matchFeatures(a, b))
            pairs.push_back({m.first, m.second, a[m.first].x, a[m.first].y, b[m.second].x, b[m.second].y, false});
    }
    return toArray(pairs);
}

} // namespace

void addRegistration(py::module_& module) {
    PYBIND11_NUMPY_DTYPE(Feature, x, y, scale, angle, squeeze, direction, score, descriptor);
    PYBIND11_NUMPY_DTYPE(Pair, first, second, x1, y1, x2, y2, inlier);
    module.attr("FEATURE") = py::dtype::of<Feature>();
    module.attr("MATCH") = py::dtype::of<Pair>();
    py::class_<Prepared>(module, "Prepared", "A picture made ready for several registrations, by prepare(). It can be pickled.")
        .def(py::pickle(
            [](const Prepared& prepared) {
                std::vector<unsigned char> bytes;
                {
                    const py::gil_scoped_release free;
                    bytes = prepared.store();
                }
                return py::bytes(reinterpret_cast<const char*>(bytes.data()), bytes.size());
            },
            [](const py::bytes& bytes) {
                const std::string_view view = bytes;
                std::unique_ptr<Prepared> made;
                {
                    const py::gil_scoped_release free;
                    made = std::make_unique<Prepared>(Prepared::restored(view.data(), view.size()));
                }
                if (!made->reason().empty())
                    throw py::value_error("state: " + made->reason());
                return made;
            }));
    module.def("prepare", [](const py::object& image, const py::object& mostFeatures, const py::object& workingSize) {
        std::unique_ptr<Prepared> made = prepare(image, "image", options(py::int_(3), mostFeatures, workingSize, true));
        if (!made->reason().empty())
            throw py::value_error("image: " + made->reason());
        return made;
    });
    module.def("register", registerTwo);
    module.def("find_features", findFeatures);
    module.def("match_features", matchFeatures);
}

} // namespace kelPython
