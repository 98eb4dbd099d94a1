// Sizes and offsets of every public record and class: programs that were built against an earlier header rely on them. The
// compiler checks; there is nothing to run.
#include <cstddef>
#include <kel/kelImage.h>
#include <kel/kelMat.h>
#include <type_traits>

#define EXPECT_MEMBER(record, member, at)                                                                                      \
    static_assert(offsetof(record, member) == (at), #record "::" #member " is not where programs look for it")
#define EXPECT_SIZE(record, bytes) static_assert(sizeof(record) == (bytes), "the size of " #record " has changed")

static_assert(std::is_same<kelValue_s32, int>::value, "");

EXPECT_SIZE(kelImage_t, 48);
EXPECT_MEMBER(kelImage_t, reserved, 0);
EXPECT_MEMBER(kelImage_t, type, 4);
EXPECT_MEMBER(kelImage_t, width, 8);
EXPECT_MEMBER(kelImage_t, height, 12);
EXPECT_MEMBER(kelImage_t, channels, 16);
EXPECT_MEMBER(kelImage_t, depth, 20);
EXPECT_MEMBER(kelImage_t, step, 24);
EXPECT_MEMBER(kelImage_t, size, 28);
EXPECT_MEMBER(kelImage_t, data, 32);
EXPECT_MEMBER(kelImage_t, buffer, 40);

EXPECT_SIZE(kelKeypoint2DF32_t, 16);
EXPECT_MEMBER(kelKeypoint2DF32_t, x, 0);
EXPECT_MEMBER(kelKeypoint2DF32_t, y, 4);
EXPECT_MEMBER(kelKeypoint2DF32_t, score, 8);
EXPECT_MEMBER(kelKeypoint2DF32_t, tag, 12);

static_assert(sizeof KEL_COLOR_TABLE_SAFE == 216 * 3 && sizeof KEL_COLOR_TABLE_PSEUDO == 64 * 3, "");
static_assert(KEL_PIXEL_TYPE_U8G == 0 && KEL_PIXEL_TYPE_S16G == 3 && KEL_PIXEL_TYPE_U8XYZ == 8 && KEL_PIXEL_TYPE_U8XYZA == 16 &&
                  KEL_PIXEL_TYPE_U8ZYX == 24 && KEL_PIXEL_TYPE_U8ZYXA == 32 && KEL_PIXEL_TYPE_U8YUV == 40 &&
                  KEL_PIXEL_TYPE_F64YUV == 47,
              "");

static_assert(!std::is_polymorphic<kelMat>::value && std::is_standard_layout<kelMat>::value, "");
EXPECT_SIZE(kelMat, 24);
EXPECT_MEMBER(kelMat, m_Width, 0);
EXPECT_MEMBER(kelMat, m_Height, 4);
EXPECT_MEMBER(kelMat, m_IsCreated, 8);
EXPECT_MEMBER(kelMat, m_Data, 16);

EXPECT_SIZE(kelMatEstimatorH, sizeof(kelMat));
EXPECT_SIZE(kelMatEstimatorP, sizeof(kelMat));

static_assert(KEL_CORRESP_MAX == 10000, "");
EXPECT_SIZE(kelMatCorrespH, 104);
EXPECT_MEMBER(kelMatCorrespH, m_Num, 0);
EXPECT_MEMBER(kelMatCorrespH, m_SrcX, 8);
EXPECT_MEMBER(kelMatCorrespH, m_SrcY, 32);
EXPECT_MEMBER(kelMatCorrespH, m_DstX, 56);
EXPECT_MEMBER(kelMatCorrespH, m_DstY, 80);

EXPECT_SIZE(kelMatCorrespP, 128);
EXPECT_MEMBER(kelMatCorrespP, m_Num, 0);
EXPECT_MEMBER(kelMatCorrespP, m_ObjX, 8);
EXPECT_MEMBER(kelMatCorrespP, m_ObjY, 32);
EXPECT_MEMBER(kelMatCorrespP, m_ObjZ, 56);
EXPECT_MEMBER(kelMatCorrespP, m_ImgX, 80);
EXPECT_MEMBER(kelMatCorrespP, m_ImgY, 104);

EXPECT_SIZE(kelMatGeneratorP, 8 * sizeof(kelMat));
EXPECT_MEMBER(kelMatGeneratorP, matView, 0);
EXPECT_MEMBER(kelMatGeneratorP, matViewScale, 24);
EXPECT_MEMBER(kelMatGeneratorP, matViewShift, 48);
EXPECT_MEMBER(kelMatGeneratorP, matCamera, 72);
EXPECT_MEMBER(kelMatGeneratorP, matCameraInverse, 96);
EXPECT_MEMBER(kelMatGeneratorP, matObject, 120);
EXPECT_MEMBER(kelMatGeneratorP, matObjectScale, 144);
EXPECT_MEMBER(kelMatGeneratorP, matObjectShift, 168);
