// Rotation, intrinsic and translation builders, and angles out of rotations.
#include "MatSupport.h"
#include "Stops.h"

using namespace kel_test;

namespace {

constexpr float kPi = 3.1415927f;
constexpr double kFewBits = 4 * kEps;

kelMat turn(char axis, float degrees) {
    kelMat R;
    if (axis == 'X')
        R.setDataRotationMatrix_X_3x3(degrees);
    else if (axis == 'Y')
        R.setDataRotationMatrix_Y_3x3(degrees);
    else
        R.setDataRotationMatrix_Z_3x3(degrees);
    return R;
}

using Angles = std::array<float, 3>;
using Extractor = bool (kelMat::*)(float&, float&, float&);

Angles extracted(const kelMat& M, Extractor extractor) {
    kelMat R(M);
    Angles a = {-1000, -1000, -1000};
    EXPECT_TRUE((R.*extractor)(a[0], a[1], a[2]));
    return a;
}

void expectAngles(const Angles& actual, const Angles& expected, double tolerance = 1e-3) {
    for (int i = 0; i < 3; ++i)
        EXPECT_NEAR(std::remainder(double(actual[i]) - expected[i], 360.0), 0, tolerance)
            << "angle " << i << " of " << testing::PrintToString(actual) << ", expected " << testing::PrintToString(expected);
}

const Extractor kExtractors[] = {&kelMat::getAngleFromRotationMatrix_XYZ_3x3, &kelMat::getAngleFromRotationMatrix_ZYX_3x3,
                                 &kelMat::getAngleFromRotationMatrix_ZZYX_3x3};

} // namespace

TEST(RotationBuilders, TurnAboutOneAxis) {
    const float c = std::cos(1.5707964f); // of the float quarter turn, not 0
    EXPECT_TRUE(same(turn('X', 90), mat({{1, 0, 0}, {0, c, -1}, {0, 1, c}})));
    EXPECT_TRUE(same(turn('Y', 90), mat({{c, 0, 1}, {0, 1, 0}, {-1, 0, c}})));
    EXPECT_TRUE(same(turn('Z', 90), mat({{c, -1, 0}, {1, c, 0}, {0, 0, 1}})));
    EXPECT_NE(c, 0.0f);
}

TEST(RotationBuilders, ComposeAxesInTheirOrderAndProductsAsWritten) {
    const auto sine = [](float degrees) { return std::sin(degrees * kPi / 180.0f); };
    const auto cosine = [](float degrees) { return std::cos(degrees * kPi / 180.0f); };
    std::mt19937 random = generator(21);
    std::uniform_real_distribution<float> uniform(-400, 400);
    for (int i = 0; i < 500; ++i) {
        const float x = uniform(random), y = uniform(random), z = uniform(random);
        const float sx = sine(x), cx = cosine(x), sy = sine(y), cy = cosine(y), sz = sine(z), cz = cosine(z);
        kelMat R(4, 4);
        R.setDataRotationMatrix_XYZ_3x3(x, y, z);
        EXPECT_TRUE(near(R, turn('Z', z) * turn('Y', y) * turn('X', x), kFewBits));
        EXPECT_TRUE(same(R, mat({{cz * cy, sx * (cz * sy) - sz * cx, (cz * sy) * cx + sz * sx},
                                 {sz * cy, sx * (sz * sy) + cz * cx, (sz * sy) * cx - cz * sx},
                                 {-sy, cy * sx, cy * cx}})));
        R.setDataRotationMatrix_ZYX_3x3(x, y, z);
        EXPECT_TRUE(near(R, turn('X', x) * turn('Y', y) * turn('Z', z), kFewBits));
        EXPECT_TRUE(same(R, mat({{cy * cz, -cy * sz, sy},
                                 {cx * sz + cz * (sx * sy), cx * cz - (sx * sy) * sz, -sx * cy},
                                 {sx * sz - cz * (cx * sy), sx * cz + (cx * sy) * sz, cx * cy}})));
        R.setDataRotationMatrix_ZYZ_3x3(x, y, z);
        EXPECT_TRUE(near(R, turn('Z', z) * turn('Y', x) * turn('Z', y), kFewBits));
        EXPECT_EQ(R[0][2], cz * sx);
        EXPECT_EQ(R[1][2], sz * sx);
        EXPECT_EQ(R[2][2], cx);
        R.setDataRotationMatrix_ZZYZ_3x3(x, y, z);
        EXPECT_TRUE(near(R, turn('Z', y) * turn('Y', x) * turn('Z', -y) * turn('Z', z), kFewBits));
        EXPECT_EQ(R[0][2], cy * sx);
        EXPECT_EQ(R[1][2], sy * sx);
        EXPECT_EQ(R[2][0], -sx * (cz * cy + sz * sy)) << "by the angle sum, q - p is not formed";
        EXPECT_EQ(R[2][1], sx * (sz * cy - cz * sy));
    }
}

TEST(CameraBuilders, PlaceTheirArguments) {
    kelMat M(9, 9);
    M.setDataIntrinsicMatrix_3x3(800, 700, 320, 240, 0.5f);
    EXPECT_TRUE(same(M, mat({{800, 0.5f, 320}, {0, 700, 240}, {0, 0, 1}})));
    M.setDataTranslationMatrix_3x1(1, -2, 3);
    EXPECT_TRUE(same(M, mat({{1}, {-2}, {3}})));
}

TEST(RotationAngles, InvertTheBuilders) {
    std::mt19937 random = generator(22);
    std::uniform_real_distribution<float> any(-179, 179), half(-85, 85), tilt(5, 175);
    for (int i = 0; i < 2000; ++i) {
        kelMat R;
        const float x = any(random), y = half(random), z = any(random), t = tilt(random);
        R.setDataRotationMatrix_XYZ_3x3(x, y, z);
        expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_XYZ_3x3), {x, y, z});
        R.setDataRotationMatrix_ZYX_3x3(x, y, z);
        expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_ZYX_3x3), {x, y, z});
        R.setDataRotationMatrix_ZZYZ_3x3(t, x, z);
        const double sine = std::sin(t * kPi / 180);
        const double lost = 4 * kEps / (sine * sine); // of the azimuth's cosine; near 0 and 180 degrees acos takes its root
        expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_ZZYX_3x3), {t, x, z}, std::sqrt(2 * lost) * 180 / kPi);
    }
    kelMat I(3, 3);
    I.setDataIdentity(1);
    for (const Extractor extractor : kExtractors)
        for (const float angle : extracted(I, extractor))
            EXPECT_EQ(angle, 0.0f);
}

TEST(RotationAngles, MayOverwriteTheirMatrix) {
    for (const float tilt : {0.0f, 40.0f})
        for (const Extractor extractor : kExtractors) {
            kelMat R;
            R.setDataRotationMatrix_ZZYZ_3x3(tilt, 20, 70);
            const Angles apart = extracted(R, extractor);
            (R.*extractor)(R[0][0], R[1][0], R[2][2]);
            EXPECT_EQ((Angles{R[0][0], R[1][0], R[2][2]}), apart);
        }
}

TEST(RotationAngles, TakeTheArcTangentInDouble) {
    const auto degrees = [](double rad) { return static_cast<float>(rad) * 180.0f / kPi; };
    std::mt19937 random = generator(23);
    std::uniform_real_distribution<float> uniform(-170, 170);
    for (int i = 0; i < 1000; ++i) {
        kelMat R;
        R.setDataRotationMatrix_XYZ_3x3(uniform(random), uniform(random) / 2, uniform(random));
        const double radY = static_cast<float>(
            std::atan2(-double(R[2][0]), double(std::min(std::sqrt(R[2][2] * R[2][2] + R[2][1] * R[2][1]), 1.0f))));
        const double c = std::cos(radY);
        const auto over = [c](float v) { return double(std::min(std::max(static_cast<float>(v / c), -1.0f), 1.0f)); };
        const Angles expected = {degrees(std::atan2(over(R[2][1]), over(R[2][2]))), degrees(radY),
                                 degrees(std::atan2(over(R[1][0]), over(R[0][0])))};
        ASSERT_EQ(extracted(R, &kelMat::getAngleFromRotationMatrix_XYZ_3x3), expected);
    }
}

TEST(RotationAngles, FoldIntoOneAngleAtTheGimbal) {
    kelMat R;
    for (float y : {90.0f, -90.0f}) {
        const float sign = y > 0 ? 1.0f : -1.0f;
        R.setDataRotationMatrix_XYZ_3x3(10, y, 30);
        expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_XYZ_3x3), {10 - sign * 30, y, 0}, 0.01);
        R.setDataRotationMatrix_ZYX_3x3(10, y, 30);
        expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_ZYX_3x3), {10 + sign * 30, y, 0}, 0.01);
    }
    for (float q : {0.0f, 50.0f, -120.0f, 180.0f})
        for (float p : {0.0f, 40.0f}) {
            R.setDataRotationMatrix_ZZYZ_3x3(0, p, q);
            expectAngles(extracted(R, &kelMat::getAngleFromRotationMatrix_ZZYX_3x3), {0, 0, q}, 0.05);
        }
}

TEST(RotationAngles, BearMatricesThatAreNoRotations) {
    const Angles saturated = extracted(mat({{5, 0, 0}, {0, 5, 5}, {-2, 5, 5}}), &kelMat::getAngleFromRotationMatrix_XYZ_3x3);
    EXPECT_EQ(saturated[1], 45.0f) << "sine and cosine clamped to 1";
    EXPECT_EQ(saturated[0], 45.0f);

    // Tilt beyond the range of the arc cosine, then azimuth and roll by saturation, each test in its turn.
    const auto angles = [](const kelMat& M) { return extracted(M, &kelMat::getAngleFromRotationMatrix_ZZYX_3x3); };
    EXPECT_EQ(angles(mat({{2, 0, 0}, {9, 1, 0}, {0, 0, 1.5f}})), (Angles{0, 0, 0}));
    EXPECT_EQ(angles(mat({{-2, 0, 0}, {9, 1, 0}, {0, 0, 1.5f}})), (Angles{0, 0, 180}));
    EXPECT_EQ(angles(mat({{0, 0, 0}, {9, 1, 0}, {0, 0, 1}})), (Angles{0, 0, 90}));
    EXPECT_EQ(angles(mat({{0, 0, 0}, {-9, 1, 0}, {0, 0, 1}})), (Angles{0, 0, -90}));
    EXPECT_NEAR(angles(mat({{0.5f, 0, 0}, {-0.5f, 1, 0}, {0, 0, 1}}))[2], -60, 1e-4);
    // t = pi with the sine -8.7e-8: a positive element divided by it is far below -1.
    EXPECT_EQ(angles(mat({{0, 0, 1}, {0, 0, 0}, {-2, 0, -1.5f}})), (Angles{180, 180, 0}));
    EXPECT_EQ(angles(mat({{0, 0, -1}, {0, 0, 0}, {-2, 0, -1.5f}})), (Angles{180, 0, 180}));
    EXPECT_EQ(angles(mat({{0, 0, 0}, {0, 0, -1}, {2, 0, -1.5f}})), (Angles{180, 90, 90}));
    EXPECT_EQ(angles(mat({{0, 0, 0}, {0, 0, 1}, {2, 0, -1.5f}})), (Angles{180, -90, -90}));
}

TEST(RotationAngles, StopOnOtherSizesButForTheInertOne) {
    const char* const names[] = {"XYZ", "ZYX", "ZZYX"};
    kelMat wrong(3, 4);
    float a = 1, b = 2, c = 3;
    for (int i = 0; i < 3; ++i)
        EXPECT_STOPS((wrong.*kExtractors[i])(a, b, c), "this->m_Width == 3 && this->m_Height == 3", "kelMat/src/kelMat.cpp",
                     std::string("bool kelMat::getAngleFromRotationMatrix_") + names[i] + "_3x3(float&, float&, float&)");
    EXPECT_TRUE(wrong.getAngleFromRotationMatrix_ZYZ_3x3(a, b, c));
    EXPECT_TRUE(a == 1 && b == 2 && c == 3);
}
