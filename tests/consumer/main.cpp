// Both halves from C++.
#include <cstdio>
#include <kel/kelImage.hpp>
#include <kel/kelMat.h>

int main() {
    kelMatCorrespH pairs;
    for (int i = 0; i < 25; ++i)
        pairs.add(i % 5 * 10.f, i / 5 * 10.f, i % 5 * 20.f + 3, i / 5 * 20.f + 4);
    kelMatEstimatorH H;
    int inliers = 0;
    const bool found = H.estimate_byRANSAC_fine(pairs, 1, &inliers);
    kel::Image image(17, 1, KEL_PIXEL_TYPE_U8G);
    std::printf("%d %d %.2f %.2f, step %d\n", found, inliers, H[0][0], H[0][2], image->step);
}
