// Prints a digest of every function of the lists and of registrations of the demo's scenes, one a line. The bytes are the same on
// every processor and with the kernels of every instruction set: what it printed once is kept beside it.
#include <cfenv>
#include <cstdio>
#include <cstdlib>
#include <kel/kelRegister.h>
#include <map>

#include "ImageScene.h"
#include "MatInputs.h"
#include "Sweep.h"
#include "common/Scene.h"

namespace {

using namespace kel_test;

// FNV-1a, after G. Fowler, L. C. Noll and K.-P. Vo.
class Digest {
public:
    void add(const void* data, size_t bytes) {
        for (const auto* p = static_cast<const uint8_t*>(data); bytes > 0; --bytes, ++p)
            m_value = (m_value ^ *p) * 0x100000001b3;
    }
    template <class T> void add(T value) { add(&value, sizeof value); }
    void add(float value) { add<float>(std::isnan(value) ? kNan : value); } // which NaN is the processor's affair
    void add(const Image& image) { add(image.data(), image.size()); }
    void add(const kelMat& M) {
        for (int i = 0; i < M.m_Height * M.m_Width; ++i)
            add(M.m_Data[i]);
    }
    void print(const std::string& name) const {
        std::printf("%016llx %s\n", static_cast<unsigned long long>(m_value), name.c_str());
    }

private:
    uint64_t m_value = 0xcbf29ce484222325;
};

void setSeed(int seed) {
    setenv("KEL_TEST_SEED", std::to_string(seed).c_str(), 1);
    std::srand(static_cast<unsigned>(seed));
}
constexpr int kSeeds[] = {1, 2, 3};

// Setting number `round` of an operation on a source of this size: everything takes its turn.
Setting settingOf(const ImageOperation& o, Size src, size_t round) {
    Setting s = {src, o.parameters[round % o.parameters.size()]};
    s.guard = round % 2 ? Guard::Behind : Guard::Before;
    s.fill = kFills[round % std::size(kFills)];
    s.inPlace = o.inPlace && round % 3 == 0;
    s.half = o.half ? static_cast<int>(round % 3) * 16 - 16 : -1;
    s.spare = round % 5 ? 0 : 4;
    return s;
}

void add(Digest& digest, const ImageOperation& o) {
    size_t round = 0;
    for (int seed : kSeeds)
        for (int width : widths())
            for (size_t i = 0; i < std::min<size_t>(o.heights.size(), 5); ++i) {
                ++round;
                const Setting s = settingOf(o, {width, o.heights[round % o.heights.size()]}, round);
                if (!isDefined(o, s) || round % static_cast<size_t>(o.stride) != 0)
                    continue;
                setSeed(seed);
                const Scene scene(o, s, o.from);
                std::fesetround(o.rounds ? kRoundingModes[round % std::size(kRoundingModes)].mode : FE_TONEAREST);
                scene.apply(o.call);
                std::fesetround(FE_TONEAREST);
                scene.forEach([&](const Image& image) { digest.add(image); });
                digest.add(rand());
            }
}

void digest(const MatOperation& o) {
    Digest digest;
    for (int seed : kSeeds) {
        setSeed(seed);
        forAllCalls(o, [&](const kelMat& A, const kelMat& B) {
            for (float value : o.call(A, B))
                digest.add(value);
        });
    }
    digest.print(o.name);
}

// Turns by angles of up to 17 radians, within which the C library's sines and cosines are the same everywhere.
void digestTurns() {
    Digest digest;
    for (float degrees = -974; degrees <= 974; degrees += 0.0625f) {
        kelMat turn;
        turn.setDataRotationMatrix_Z_3x3(degrees);
        digest.add(turn);
    }
    digest.print("setDataRotationMatrix_Z_3x3");
}

void digestRegistration(unsigned seed) {
    const std::string name = "scene " + std::to_string(seed) + ", ";
    const kel_examples::Scene scene = kel_examples::renderScene(seed);
    Digest pictures, prepared, features, result;
    for (const auto* picture : {&scene.first, &scene.second}) {
        pictures.add((*picture)->data, static_cast<size_t>((*picture)->size));
        const std::vector<unsigned char> bytes = kelRegister::Prepared(picture->get()).store();
        prepared.add(bytes.data(), bytes.size());
    }
    pictures.print(name + "pictures");
    prepared.print(name + "prepared");
    std::srand(seed);
    const kelRegister::Result r = kelRegister::registerPictures(scene.first.get(), scene.second.get());
    for (const auto* set : {&r.first, &r.second})
        for (const kelRegister::Feature& f : *set) {
            for (float value : {f.x, f.y, f.scale, f.angle, f.squeeze, f.direction})
                features.add(value);
            features.add(f.descriptor, sizeof f.descriptor);
        }
    features.print(name + "features");
    for (const kelRegister::Match& m : r.matches)
        for (int value : {m.first, m.second, static_cast<int>(m.inlier)})
            result.add(value);
    result.add(r.H);
    for (float value : {static_cast<float>(r.tested), static_cast<float>(r.agreeing), r.share, r.expectedError})
        result.add(value);
    result.add(rand());
    result.print(name + "registration");
}

} // namespace

int main() {
    std::map<std::string, Digest> ofFunctions; // whatever types each takes
    for (const ImageOperation& o : imageOperations())
        add(ofFunctions[o.function()], o);
    for (const auto& [function, digest] : ofFunctions)
        digest.print(function);
    for (const MatOperation& o : matOperations())
        digest(o);
    digestTurns();
    for (int seed : kSeeds)
        digestRegistration(static_cast<unsigned>(seed));
}
