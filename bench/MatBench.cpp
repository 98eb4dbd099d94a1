// Matrices and their numerics beside Eigen, LAPACK and OpenCV, all in single precision, outputs kept between calls.
#include "Bench.h"

#include <algorithm>
#include <kel/kelMat.h>
#include <random>
#include <vector>
#if KEL_BENCH_EIGEN
#include <Eigen/Dense>
#endif
#if KEL_BENCH_OPENCV
#include <opencv2/core.hpp>
#endif

#if KEL_BENCH_LAPACK
extern "C" {
void sgesdd_(const char* jobz, const int* m, const int* n, float* a, const int* lda, float* s, float* u, const int* ldu,
             float* vt, const int* ldvt, float* work, const int* lwork, int* iwork, int* info);
void sgesvd_(const char* jobu, const char* jobvt, const int* m, const int* n, float* a, const int* lda, float* s, float* u,
             const int* ldu, float* vt, const int* ldvt, float* work, const int* lwork, int* info);
void ssyev_(const char* jobz, const char* uplo, const int* n, float* a, const int* lda, float* w, float* work, const int* lwork,
            int* info);
void ssygv_(const int* itype, const char* jobz, const char* uplo, const int* n, float* a, const int* lda, float* b,
            const int* ldb, float* w, float* work, const int* lwork, int* info);
void sgetrf_(const int* m, const int* n, float* a, const int* lda, int* ipiv, int* info);
void sgetri_(const int* n, float* a, const int* lda, const int* ipiv, float* work, const int* lwork, int* info);
}
#endif

namespace {

using namespace kel_bench;
using Floats = std::vector<float>;

Floats randomFloats(int count) {
    std::mt19937 random(1);
    std::uniform_real_distribution<float> uniform(-1, 1);
    Floats values(count);
    std::generate(values.begin(), values.end(), [&] { return uniform(random); });
    return values;
}

kelMat kelOf(const Floats& values, int rows, int columns) {
    kelMat M(rows, columns, false);
    std::copy(values.begin(), values.end(), M.m_Data);
    return M;
}

// Symmetric positive definite.
Floats definiteFloats(int n) {
    const kelMat M = kelOf(randomFloats(n * 3 * n), n, 3 * n), S = M * M.getTransposedMatrix();
    return Floats(S.m_Data, S.m_Data + n * n);
}

#if KEL_BENCH_EIGEN
using RowMajor = Eigen::Matrix<float, Eigen::Dynamic, Eigen::Dynamic, Eigen::RowMajor>;
RowMajor eigenOf(const Floats& values, int rows, int columns) {
    return Eigen::Map<const RowMajor>(values.data(), rows, columns);
}
#endif

#if KEL_BENCH_OPENCV
cv::Mat cvOf(const Floats& values, int rows, int columns) {
    return cv::Mat(rows, columns, CV_32F, const_cast<float*>(values.data())).clone();
}
#endif

#if KEL_BENCH_LAPACK
Floats byColumns(const Floats& values, int rows, int columns) {
    Floats result(values.size());
    for (int r = 0; r < rows; ++r)
        for (int c = 0; c < columns; ++c)
            result[c * rows + r] = values[r * columns + c];
    return result;
}
#endif

std::string sizeName(int rows, int columns) {
    return std::to_string(rows) + "x" + std::to_string(columns);
}

void addProduct(const std::string& operation, int rows, int inner, int columns) {
    const Floats a = randomFloats(rows * inner), b = randomFloats(inner * columns + 1);
    std::vector<Run> runs = {{"kel", [=] {
                                  return Body([A = kelOf(a, rows, inner), B = kelOf(b, inner, columns)] {
                                      const kelMat R = A * B;
                                      volatile float kept = R[0][0];
                                      (void)kept;
                                  });
                              }}};
#if KEL_BENCH_EIGEN
    runs.push_back({"Eigen", [=] {
                        return Body([A = eigenOf(a, rows, inner), B = eigenOf(b, inner, columns)] {
                            const RowMajor R = A * B;
                            volatile float kept = R(0, 0);
                            (void)kept;
                        });
                    }});
#endif
#if KEL_BENCH_OPENCV
    runs.push_back({"OpenCV", [=] {
                        return Body([A = cvOf(a, rows, inner), B = cvOf(b, inner, columns)] {
                            const cv::Mat R = A * B;
                            volatile float kept = R.at<float>(0, 0);
                            (void)kept;
                        });
                    }});
#endif
    add(operation, sizeName(rows, inner), {0, 0}, std::move(runs));
}

void addSvd(int rows, int columns) {
    const Floats a = randomFloats(rows * columns);
    std::vector<Run> runs = {{"kel", [=] {
                                  return Body([A = kelOf(a, rows, columns), U = kelMat(), W = kelMat(),
                                               V = kelMat()]() mutable { A.getDecomposedMatrix_SV(U, W, V); });
                              }}};
#if KEL_BENCH_EIGEN
    const unsigned thin = Eigen::ComputeThinU | Eigen::ComputeThinV;
    runs.push_back({"Eigen BDCSVD", [=] {
                        const Eigen::MatrixXf A = eigenOf(a, rows, columns);
                        return Body(
                            [=, svd = Eigen::BDCSVD<Eigen::MatrixXf>(rows, columns, thin)]() mutable { svd.compute(A, thin); });
                    }});
    runs.push_back(
        {"Eigen JacobiSVD", [=] {
             const Eigen::MatrixXf A = eigenOf(a, rows, columns);
             return Body([=, svd = Eigen::JacobiSVD<Eigen::MatrixXf>(rows, columns, thin)]() mutable { svd.compute(A, thin); });
         }});
#endif
#if KEL_BENCH_LAPACK
    struct Buffers {
        Floats a, s, u, vt, work;
        std::vector<int> integers;
    };
    const Buffers buffers{byColumns(a, rows, columns),
                          Floats(columns),
                          Floats(rows * columns),
                          Floats(columns * columns),
                          Floats(64 * (rows + columns) + 10 * columns * columns),
                          std::vector<int>(8 * columns)};
    runs.push_back({"LAPACK sgesdd", [=] {
                        return Body([=, x = buffers, A = buffers.a]() mutable {
                            x.a = A;
                            const int lwork = static_cast<int>(x.work.size());
                            int info;
                            sgesdd_("S", &rows, &columns, x.a.data(), &rows, x.s.data(), x.u.data(), &rows, x.vt.data(),
                                    &columns, x.work.data(), &lwork, x.integers.data(), &info);
                        });
                    }});
    runs.push_back({"LAPACK sgesvd", [=] {
                        return Body([=, x = buffers, A = buffers.a]() mutable {
                            x.a = A;
                            const int lwork = static_cast<int>(x.work.size());
                            int info;
                            sgesvd_("S", "S", &rows, &columns, x.a.data(), &rows, x.s.data(), x.u.data(), &rows, x.vt.data(),
                                    &columns, x.work.data(), &lwork, &info);
                        });
                    }});
#endif
#if KEL_BENCH_OPENCV
    runs.push_back({"OpenCV", [=] {
                        return Body([A = cvOf(a, rows, columns), W = cv::Mat(), U = cv::Mat(), Vt = cv::Mat()]() mutable {
                            cv::SVD::compute(A, W, U, Vt);
                        });
                    }});
#endif
    add("getDecomposedMatrix_SV", sizeName(rows, columns), {0, 0}, std::move(runs));
}

void addEigen(int n) {
    const Floats a = definiteFloats(n);
    std::vector<Run> runs = {
        {"kel", [=] { return Body([A = kelOf(a, n, n), d = kelMat(), v = kelMat()]() mutable { A.getEigenValue(d, v); }); }}};
#if KEL_BENCH_EIGEN
    runs.push_back({"Eigen", [=] {
                        return Body([A = eigenOf(a, n, n), solver = Eigen::SelfAdjointEigenSolver<RowMajor>(n)]() mutable {
                            solver.compute(A);
                        });
                    }});
#endif
#if KEL_BENCH_LAPACK
    runs.push_back({"LAPACK", [=] {
                        return Body([=, A = a, w = Floats(n), work = Floats(64 * n)]() mutable {
                            A = a;
                            const int lwork = static_cast<int>(work.size());
                            int info;
                            ssyev_("V", "U", &n, A.data(), &n, w.data(), work.data(), &lwork, &info);
                        });
                    }});
#endif
#if KEL_BENCH_OPENCV
    runs.push_back(
        {"OpenCV", [=] { return Body([A = cvOf(a, n, n), d = cv::Mat(), v = cv::Mat()]() mutable { cv::eigen(A, d, v); }); }});
#endif
    add("getEigenValue", sizeName(n, n), {0, 0}, std::move(runs));
}

void addGeneralizedEigen(int n) {
    const Floats a = randomFloats(n * n), b = definiteFloats(n);
    std::vector<Run> runs = {{"kel", [=] {
                                  const kelMat M = kelOf(a, n, n), S = M + M.getTransposedMatrix();
                                  return Body([A = S, B = kelOf(b, n, n), d = kelMat(), X = kelMat()]() mutable {
                                      A.getGeneralizedEigenValue(B, d, X);
                                  });
                              }}};
#if KEL_BENCH_EIGEN
    runs.push_back(
        {"Eigen", [=] {
             const RowMajor M = eigenOf(a, n, n), S = M + M.transpose();
             return Body([A = S, B = eigenOf(b, n, n),
                          solver = Eigen::GeneralizedSelfAdjointEigenSolver<RowMajor>(n)]() mutable { solver.compute(A, B); });
         }});
#endif
#if KEL_BENCH_LAPACK
    runs.push_back({"LAPACK", [=] {
                        return Body([=, A = a, B = b, w = Floats(n), work = Floats(64 * n)]() mutable {
                            A = a;
                            B = b;
                            const int lwork = static_cast<int>(work.size()), type = 1;
                            int info;
                            ssygv_(&type, "V", "U", &n, A.data(), &n, B.data(), &n, w.data(), work.data(), &lwork, &info);
                        });
                    }});
#endif
    add("getGeneralizedEigenValue", sizeName(n, n), {0, 0}, std::move(runs));
}

void addInverse(int n) {
    const Floats a = randomFloats(n * n);
    std::vector<Run> runs = {
        {"kel", [=] { return Body([A = kelOf(a, n, n), R = kelMat()]() mutable { A.getInversedMatrix(R); }); }}};
#if KEL_BENCH_EIGEN
    runs.push_back({"Eigen", [=] { return Body([A = eigenOf(a, n, n), R = RowMajor()]() mutable { R = A.inverse(); }); }});
#endif
#if KEL_BENCH_LAPACK
    runs.push_back({"LAPACK", [=] {
                        return Body([=, A = a, pivots = std::vector<int>(n), work = Floats(64 * n)]() mutable {
                            A = a;
                            const int lwork = static_cast<int>(work.size());
                            int info;
                            sgetrf_(&n, &n, A.data(), &n, pivots.data(), &info);
                            sgetri_(&n, A.data(), &n, pivots.data(), work.data(), &lwork, &info);
                        });
                    }});
#endif
#if KEL_BENCH_OPENCV
    runs.push_back(
        {"OpenCV", [=] { return Body([A = cvOf(a, n, n), R = cv::Mat()]() mutable { cv::invert(A, R, cv::DECOMP_LU); }); }});
#endif
    add("getInversedMatrix", sizeName(n, n), {0, 0}, std::move(runs));
}

void addLines() {
    for (int n : {3, 4, 12, 64})
        addProduct("matrix product", n, n, n);
    for (int rows : {20, 200, 2000})
        addProduct("product A^T A", 9, rows, 9);
    for (int rows : {20, 200, 2000, 20000})
        addSvd(rows, 9);
    addSvd(200, 12);
    for (int n : {3, 9, 12})
        addEigen(n);
    for (int n : {9, 12})
        addGeneralizedEigen(n);
    for (int n : {3, 4, 9, 32})
        addInverse(n);
}

const Lines lines(addLines);

} // namespace
