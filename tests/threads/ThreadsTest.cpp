// Every operation from eight threads at once, each on objects of its own: results equal those of one thread, and the thread
// sanitizer has something to look at.
#include <array>
#include <cstring>
#include <gtest/gtest.h>
#include <kel/kelImage.h>
#include <kel/kelMat.h>
#include <thread>
#include <vector>

#include "Random.h"

namespace {

// A running hash of results.
class Digest {
public:
    void bytes(const void* data, size_t count) {
        for (size_t i = 0; i < count; ++i)
            m_value = (m_value ^ static_cast<const unsigned char*>(data)[i]) * 1099511628211u;
    }
    template <class T> void value(const T& v) { bytes(&v, sizeof v); } // arrays, too
    void matrix(const kelMat& M) {
        value(M.m_Height);
        bytes(M.m_Data, sizeof(float) * static_cast<size_t>(M.m_Width) * static_cast<size_t>(M.m_Height));
    }
    void image(const kelImage_t* image) { bytes(image->data, static_cast<size_t>(image->size)); }
    uint64_t result() const { return m_value; }

private:
    uint64_t m_value = 14695981039346656037u;
};

constexpr int kTypes[] = {KEL_PIXEL_TYPE_U8G,    KEL_PIXEL_TYPE_S16G,   KEL_PIXEL_TYPE_U8XYZ, KEL_PIXEL_TYPE_U8ZYX,
                          KEL_PIXEL_TYPE_U8XYZA, KEL_PIXEL_TYPE_U8ZYXA, KEL_PIXEL_TYPE_U8YUV};
constexpr int kWidth = 64, kHeight = 48; // a whole number of vector blocks: no operation looks beyond a row

// Images are released when the worker is done with them; all bytes, padding included, are known from the start.
class Images {
public:
    ~Images() {
        for (kelImage_t* image : m_all)
            releaseKelImage(&image);
    }
    kelImage_t* make(int type, int width = kWidth, int height = kHeight) {
        m_all.push_back(createKelImage(width, height, type));
        clearKelImage(m_all.back());
        return m_all.back();
    }
    kelImage_t* noise(int type, uint32_t salt) {
        kelImage_t* const image = make(type);
        std::mt19937 random = kel_test::generator(salt);
        for (int i = 0; i < image->size; ++i)
            image->data[i] = static_cast<unsigned char>(random());
        return image;
    }

private:
    std::vector<kelImage_t*> m_all;
};

void recordsAndTransfer(Digest& digest) {
    for (int type : kTypes) {
        Images images;
        kelImage_t* const image = images.noise(type, 1);
        kelImage_t* copy = cloneKelImage(image);
        copyKelImage(copy, image);
        std::vector<unsigned char> buffer(4 * kWidth * kHeight);
        storeKelImageData(buffer.data(), kWidth, kHeight, kWidth, copy);
        loadKelImageData(copy, buffer.data(), kWidth / 2, kHeight, kWidth);
        storeKelImage("", copy);
        digest.value(loadKelImage("") == nullptr);
        digest.image(copy);
        releaseKelImage(&copy);
        kelImage_t* header = createKelImageHeader(3, 3, type);
        digest.value(header->size);
        releaseKelImageHeader(&header);
    }
    digest.bytes(KEL_COLOR_TABLE_SAFE, sizeof KEL_COLOR_TABLE_SAFE);
    digest.bytes(KEL_COLOR_TABLE_PSEUDO, sizeof KEL_COLOR_TABLE_PSEUDO);
}

void rectangles(Digest& digest) {
    const kelValue_s32 s[4] = {-3, 5, 18, 27};
    const float f[4] = {-3, 5.5f, 18, 27};
    for (auto translate : {kel_rectangle_translate_pp1_to_ps1_s32, kel_rectangle_translate_pp1_to_ps2_s32,
                           kel_rectangle_translate_ps1_to_pp1_s32, kel_rectangle_translate_ps1_to_ps2_s32,
                           kel_rectangle_translate_ps2_to_pp1_s32, kel_rectangle_translate_ps2_to_ps1_s32}) {
        kelValue_s32 d[4] = {};
        translate(d, s);
        digest.value(d);
    }
    for (auto translate : {kel_rectangle_translate_pp1_to_ps1_f32, kel_rectangle_translate_pp1_to_ps2_f32,
                           kel_rectangle_translate_ps1_to_pp1_f32, kel_rectangle_translate_ps1_to_ps2_f32,
                           kel_rectangle_translate_ps2_to_pp1_f32, kel_rectangle_translate_ps2_to_ps1_f32}) {
        float d[4] = {};
        translate(d, f);
        digest.value(d);
    }
}

struct Converter {
    int from, to;
    void (*convert)(kelImage_t*, const kelImage_t*);
};
const Converter kConverters[] = {
    {3, 0, convertKelImage_S16G_to_U8G},          {3, 8, convertKelImage_S16G_to_U8XYZ},
    {3, 16, convertKelImage_S16G_to_U8XYZA},      {8, 0, convertKelImage_U8XYZ_to_U8G},
    {8, 3, convertKelImage_U8XYZ_to_S16G},        {8, 24, convertKelImage_U8XYZ_to_U8ZYX},
    {8, 16, convertKelImage_U8XYZ_to_U8XYZA},     {8, 32, convertKelImage_U8XYZ_to_U8ZYXA},
    {16, 8, convertKelImage_U8XYZA_to_U8XYZ},     {16, 24, convertKelImage_U8XYZA_to_U8ZYX},
    {16, 32, convertKelImage_U8XYZA_to_U8ZYXA},   {40, 24, convertKelImage_U8YUV_to_U8RGB},
    {40, 8, convertKelImage_U8YUV_to_U8BGR},      {40, 16, convertKelImage_U8YUV_to_U8BGRA},
    {40, 32, convertKelImage_U8YUV_to_U8RGBA},    {40, 0, convertKelImage_U8YUV_to_U8G},
    {0, 16, convertKelImage_U8G_to_U8XYZA},       {0, 8, convertKelImage_U8G_to_U8XYZ},
    {0, 3, convertKelImage_U8G_to_S16G},          {0, 8, convertKelImageSSE_U8G_to_U8XYZ},
    {0, 16, convertKelImageSSE_U8G_to_U8XYZA},    {0, 3, convertKelImageSSE_U8G_to_S16G},
    {40, 0, convertKelImageSSE_U8YUV_to_U8G},     {40, 32, convertKelImageSSE_U8YUV_to_U8RGBA},
    {40, 16, convertKelImageSSE_U8YUV_to_U8BGRA}, {40, 8, convertKelImageSSE_U8YUV_to_U8BGR},
    {40, 24, convertKelImageSSE_U8YUV_to_U8RGB},  {16, 8, convertKelImage_U8XYZA_to_U8G}, // writes as if to three channels
};

void conversions(Digest& digest) {
    for (const Converter& c : kConverters) {
        Images images;
        kelImage_t* const dst = images.make(c.to);
        c.convert(dst, images.noise(c.from, 2));
        digest.image(dst);
    }
    for (int from : kTypes)
        for (int to : kTypes) {
            Images images;
            const bool misplaced = (from == 16 || from == 32) && (to == 0 || to == 3); // needs three times the room
            kelImage_t *const src = images.noise(from, 3), *const dst = images.make(misplaced ? KEL_PIXEL_TYPE_U8XYZ : to);
            if (!misplaced)
                convertKelImage(dst, src);
            digest.image(dst);
        }
    Images images;
    kelImage_t* const room = images.make(KEL_PIXEL_TYPE_S16G, kWidth, 3 * kHeight);
    kelImage_t record = *room;
    record.height = kHeight;
    convertKelImage_U8XYZA_to_S16G(&record, images.noise(16, 4));
    digest.image(room);
}

void pointsAndFilters(Digest& digest) {
    Images images;
    kelImage_t *const src = images.noise(0, 5), *const dst = images.make(0), *const tmp = images.make(0),
                      *const wide = images.make(3), *const half = images.make(0, kWidth / 2 + 16, kHeight / 2);
    const auto shortcut = [&](auto call) {
        call();
        for (const kelImage_t* image : {dst, tmp, wide, half})
            digest.image(image);
    };
    for (auto adjust : {adjustKelImage, adjustKelImage_U8G, adjustKelImageSSE_U8G})
        shortcut([&] { adjust(dst, src); });
    for (auto binalize : {binalizeKelImage, binalizeKelImage_U8G, binalizeKelImageSSE_U8G})
        shortcut([&] { binalize(dst, src, 100); });
    for (auto binalize : {binalizeKelImageAdaptive, binalizeKelImageAdaptive_U8G, binalizeKelImageAdaptiveSSE_U8G})
        shortcut([&] { binalize(dst, src, tmp); });
    shortcut([&] { applyKelFilterGaussian5X5(dst, src, wide); });
    shortcut([&] { applyKelFilterGaussian5X5_downsampling(dst, half, src, wide); });
    shortcut([&] { applyKelFilterMedianNXN(dst, src, 1); });
    shortcut([&] { applyKelFilterMedian3X3(dst, src); });
    for (auto filter :
         {applyKelFilterLaplacian3X3, applyKelFilterLaplacianSSE3X3, applyKelFilterSobel3X3, applyKelFilterSobelSSE3X3})
        shortcut([&] { filter(wide, src); });
    for (auto filter : {applyKelFilterGaussian7X7_downsampling, applyKelFilterGaussianSSE7X7_downsampling})
        shortcut([&] { filter(dst, half, src, tmp); });
    for (auto filter : {applyKelFilterGaussian7X7, applyKelFilterGaussianSSE7X7})
        shortcut([&] { filter(dst, src, tmp); });
    applyKelFilterLaplacian3X3(wide, dst);
    kelKeypoint2DF32_t keypoints[200];
    const int count = applyKelDetectorKeypointYape(keypoints, 200, dst, wide);
    digest.bytes(keypoints, sizeof keypoints[0] * static_cast<size_t>(count));
}

void transforms(Digest& digest) {
    for (int type : kTypes) {
        Images images;
        kelImage_t *const src = images.noise(type, 6), *const same = images.make(type),
                          *const half = images.make(type, kWidth / 2, kHeight / 2), *const larger = images.make(type, 96, 80);
        resizeKelImage(same, src);
        resizeKelImageNearest(half, src);
        digest.image(half);
        resizeKelImageBilinear(half, src);
        digest.image(half);
        resizeKelImageHalf(half, src);
        digest.image(half);
        resizeKelImageEnborder(larger, src, 16);
        digest.image(larger);
        resizeKelImageDeborder(same, larger, 16);
        for (auto flip : {rotateKelImageH, rotateKelImageV, rotateKelImageVH}) {
            flip(same, src);
            digest.image(same);
        }
        rotateKelImageHomography(same, src, 0.9f, 0.1f, 2, -0.1f, 1.1f, 1, 0.001f, 0, 1);
        digest.image(same);
        if (type == KEL_PIXEL_TYPE_U8XYZA) {
            kelImage_t* const spare = images.make(type, kWidth, kHeight + 1); // the pixel behind the last is read
            kelImage_t record = *spare;
            record.height = kHeight;
            std::memcpy(spare->data, src->data, static_cast<size_t>(src->size));
            resizeLinerInterpolation(larger, &record);
            digest.image(larger);
            zero_order_hold_plus_ave(half, src);
            digest.image(half);
        }
    }
}

kelMat randomMatrix(int rows, int columns, uint32_t salt) {
    std::mt19937 random = kel_test::generator(salt);
    kelMat M(rows, columns);
    for (int i = 0; i < rows * columns; ++i)
        M.m_Data[i] = static_cast<float>(random() % 2001) / 500 - 2;
    return M;
}

void matrices(Digest& digest) {
    const kelMat A = randomMatrix(4, 4, 7), B = randomMatrix(4, 4, 8);
    for (const kelMat& M : {A + 1.0f, A - 1.0f, A * 2.0f, A / 3.0f, A + B, A - B, A * B, A | B, A.getTransposedMatrix(),
                            A.getInversedMatrix(), (A | B).getTransposedMatrix().getInversedMatrix_Pseudo()})
        digest.matrix(M);
    digest.value((A, B));
    digest.value(A.getNorm() + A.getTrace() + A.getDeterminant());
    kelMat M(2, 3), T, U, V, W;
    M.create(3, 3, true);
    M.resize(4, 4, true);
    M = A;
    M.setData(0, 1, 2.0f);
    float* rows[4] = {B[0], B[1], B[2], B[3]};
    M.setData(rows);
    M.setData(B.m_Data);
    M.setData(T);
    M.setDataUnitize();
    digest.matrix(M);
    M.setDataZero();
    M.setDataIdentity(3);
    M.print("threads");
    A.getTransposedMatrix(T);
    A.getInversedMatrix(T);
    A.getInversedMatrix_Pseudo(T);
    digest.matrix(T);
    A.getDecomposedMatrix_LU(U, V);
    digest.matrix(U);
    A.getDecomposedMatrix_SV(U, W, V);
    digest.matrix(U);
    A.getDecomposedrixMat_QR(U, V);
    randomMatrix(3, 4, 9).getDecomposedMatrix_ART_3x4(U, V, W);
    digest.matrix(V);
    randomMatrix(3, 3, 9).getDecomposedMatrix_ART_3x3(U, V, W);
    kelMat S = A * A.getTransposedMatrix(), P = B * B.getTransposedMatrix();
    P = P + kelMat(4, 4); // of zeros: stays as it is
    S.getEigenValue(W, V);
    digest.matrix(W);
    S.getGeneralizedEigenValue(P, W, V);
    digest.matrix(W);
    M.release();

    float x, y, z;
    int i, j, k;
    kelMat H = randomMatrix(3, 3, 10), Q = randomMatrix(3, 4, 11), D = A;
    H.cvtPoint(1.0f, 2.0f, &x, &y);
    digest.value(x);
    Q.cvtPoint(1.0f, 2.0f, 3.0f, &x, &y);
    D.cvtPoint(1.0f, 2.0f, 3.0f, &x, &y, &z);
    digest.value(x + y + z);
    H.cvtPoint(1, 2, &i, &j);
    Q.cvtPoint(1, 2, 3, &i, &j);
    D.cvtPoint(1, 2, 3, &i, &j, &k);
    digest.value(i + j + k);

    kelMat R;
    for (auto set :
         {&kelMat::setDataRotationMatrix_X_3x3, &kelMat::setDataRotationMatrix_Y_3x3, &kelMat::setDataRotationMatrix_Z_3x3}) {
        (R.*set)(33);
        digest.matrix(R);
    }
    for (auto set : {&kelMat::setDataRotationMatrix_XYZ_3x3, &kelMat::setDataRotationMatrix_ZYX_3x3,
                     &kelMat::setDataRotationMatrix_ZYZ_3x3, &kelMat::setDataRotationMatrix_ZZYZ_3x3}) {
        (R.*set)(10, 20, 30);
        for (auto get : {&kelMat::getAngleFromRotationMatrix_XYZ_3x3, &kelMat::getAngleFromRotationMatrix_ZYX_3x3,
                         &kelMat::getAngleFromRotationMatrix_ZYZ_3x3, &kelMat::getAngleFromRotationMatrix_ZZYX_3x3}) {
            (R.*get)(x, y, z);
            digest.value(x);
        }
    }
    R.setDataIntrinsicMatrix_3x3(1, 2, 3, 4, 5);
    R.setDataTranslationMatrix_3x1(1, 2, 3);
    digest.matrix(R);
}

void kernels(Digest& digest) {
    kelMat A = randomMatrix(5, 5, 12), S = A * A.getTransposedMatrix(), LU = A, L = S, U, W, V;
    int indx[5], rotations;
    float parity, b[5] = {1, 2, 3, 4, 5};
    nr_ludcmp(LU, indx, &parity);
    nr_lubksb(LU, indx, b);
    digest.value(b);
    nr_choldc(L);
    digest.matrix(L);
    digest.value(nr_sign(-1) + nr_pythag(3, 4));
    nr_svdcmp(randomMatrix(20, 15, 13), U, W, V);
    digest.matrix(U);
    nr_jacobi(S, W, V, &rotations);
    digest.matrix(V);
    for (int n : {2, 3, 5}) {
        const kelMat M = randomMatrix(n, n, 14);
        kelMat R;
        digest.value((n == 2 ? kel_getDeterminant_2x2 : n == 3 ? kel_getDeterminant_3x3 : kel_getDeterminant_NxN)(M));
        (n == 2 ? kel_getInversedMatrix_2x2 : n == 3 ? kel_getInversedMatrix_3x3 : kel_getInversedMatrix_NxN)(M, R);
        digest.matrix(R);
    }
    kelMat R;
    kel_getInversedMatrix_NxM(randomMatrix(6, 3, 15), R);
    digest.matrix(R);
}

// What draws from rand() depends on the other threads: it takes part, its results do not.
void estimators(Digest& digest) {
    kelMatCorrespH pairsH, normalH;
    kelMatCorrespP pairsP, normalP;
    kelMatGeneratorP generator;
    kelMat P, T1, T2;
    generator.setMatView(500);
    generator.setMatViewScale(1);
    generator.setMatViewShift(10, 20);
    generator.setMatCamera(1, 2, 3, 4, 5, 6);
    generator.setMatObject(10, 20, 30, 1, 2, 3000);
    generator.setMatObjectScale(2);
    generator.setMatObjectShift(1, 2, 3);
    generator.getMat(P);
    digest.matrix(P);
    std::mt19937 random = kel_test::generator(16);
    for (int i = 0; i < 30; ++i) {
        const float x = static_cast<float>(random() % 500), y = static_cast<float>(random() % 500),
                    z = static_cast<float>(random() % 500);
        float u, v;
        P.cvtPoint(x, y, z, &u, &v);
        pairsP.add(x, y, z, u, v);
        pairsH.add(x, y, 0.9f * x + 0.1f * y + 3, 1.1f * y - 0.1f * x + static_cast<float>(random() % 3));
    }
    pairsH.normalize(normalH, T1, T2);
    digest.matrix(T1);
    pairsP.normalize(normalP, T1, T2);
    digest.matrix(T2);
    float h[8];
    UnitSquareProjection(0, 0, 0, 2, 3, 3, 2, 0, h);
    digest.value(h);
    kelMatEstimatorH H;
    kelMatEstimatorP Q;
    for (auto estimate :
         {&kelMatEstimatorH::estimate_byLSM, &kelMatEstimatorH::estimate_byLSM_fine, &kelMatEstimatorH::estimate_byTaubin}) {
        (H.*estimate)(pairsH);
        digest.matrix(H);
    }
    for (auto estimate :
         {&kelMatEstimatorP::estimate_byLSM, &kelMatEstimatorP::estimate_byLSM_fine, &kelMatEstimatorP::estimate_byTaubin}) {
        (Q.*estimate)(pairsP);
        digest.matrix(Q);
    }
    H.estimate_by4P(0, 0, 1, 1, 0, 1, 1, 3, 1, 1, 4, 4, 1, 0, 3, 1);
    digest.matrix(H);
    std::vector<bool> mask(30);
    digest.value(judgeHomography(H));
    digest.value(judgeMatrixP(P));
    digest.value(judgeInliers(H, pairsH, mask, 2));
    digest.value(judgeInliers(P, pairsP, mask, 2));

    int a, b, c, d, e, f, count;
    getRandomIndex(a, b, c, d, 9);
    getRandomIndex(9, a, b, c, d, e, f);
    H.estimate_byRANSAC_fine(pairsH, 3, &count);
    Q.estimate_byRANSAC_fine(pairsP, 3);
    generator.setMatViewRandom(1, 2);
    generator.setMatCameraRandom(0, 1, 0, 1, 0, 1, 0, 1, 0, 1, 0, 1);
    generator.setMatObjectRandom(0, 1, 0, 1, 0, 1, 0, 1, 0, 1, 0, 1);
    Images images;
    kelImage_t* const image = images.noise(0, 17);
    applyKelFilterNoise(image, image, 10 + KEL_RAND(3) + KEL_RAND_NORMAL(0));
}

using Results = std::array<uint64_t, 8>;

Results everything() {
    void (*const parts[])(Digest&) = {recordsAndTransfer, rectangles, conversions, pointsAndFilters,
                                      transforms,         matrices,   kernels,     estimators};
    Results results;
    for (size_t i = 0; i < results.size(); ++i) {
        Digest digest;
        parts[i](digest);
        results[i] = digest.result();
    }
    return results;
}

TEST(Threads, EveryOperationOnDistinctObjects) {
    constexpr int kThreads = 8, kRounds = 3;
    testing::internal::CaptureStdout(); // some of the operations print
    const Results expected = everything();
    std::vector<std::array<Results, kRounds>> results(kThreads);
    std::vector<std::thread> threads;
    for (auto& of : results)
        threads.emplace_back([&of] {
            for (Results& round : of)
                round = everything();
        });
    for (std::thread& thread : threads)
        thread.join();
    testing::internal::GetCapturedStdout();
    for (int t = 0; t < kThreads; ++t)
        for (const Results& round : results[static_cast<size_t>(t)])
            EXPECT_EQ(round, expected) << "thread " << t;
}

} // namespace
