/**
 * @file kelImage.h
 * The image half of kel: one image record and flat functions over it.
 *
 * Compiles as C99 and as C++11 and needs no other header of kel. Unless a function says otherwise
 *  - the destination comes first, then the sources, then scalar parameters, and the caller has created all of them;
 *  - a broken precondition writes its condition text, file, line and signature to standard error and aborts, in every
 *    build type;
 *  - a pixel type that a function does not handle is not an error: the function returns and writes nothing;
 *  - functions are reentrant on distinct images; no function keeps state.
 */
#ifndef KEL_IMAGE_H
#define KEL_IMAGE_H

#include <stdint.h>

#define KEL_VERSION_MAJOR 1 /**< Changes where programs have to be built anew. */
#define KEL_VERSION_MINOR 0 /**< Grows with what is added. */
#define KEL_VERSION_PATCH 0 /**< Grows with what is mended. */
#define KEL_VERSION "1.0.0" /**< The three as text. */

#if defined(__GNUC__)
#define KEL_API __attribute__((visibility("default")))
#else
#define KEL_API
#endif

#if !defined(KEL_NO_INERT_WARNINGS) && defined(__has_attribute)
#if __has_attribute(warning)
#define KEL_INERT __attribute__((warning("does nothing")))
#endif
#endif
#ifndef KEL_INERT
/** Marks functions that do nothing: a call of one warns, unless KEL_NO_INERT_WARNINGS is defined before this header. */
#define KEL_INERT
#endif

#ifdef __cplusplus
extern "C" {
#endif

/* ------------------------------------------------------------------------------------------------------------------
 * Image record and pixel types
 * ---------------------------------------------------------------------------------------------------------------- */

/** The 32-bit signed integer of the image interface: sizes, counts, thresholds. */
typedef int32_t kelValue_s32;

/**
 * Pixel-type codes: 8 x layout + kind.
 *
 * The layout fixes channels and their order in memory: G grey; XYZ, ZYX three channels; XYZA, ZYXA four; YUV two
 * (4:2:2, bytes U, Y0, V, Y1 per pair of pixels). The kind fixes the element: U8, S8 one byte; U16, S16 two; U32, S32,
 * F32 four; F64 eight. In the terms of others: U8XYZ is BGR, U8XYZA is BGRA, U8ZYX is RGB, U8ZYXA is RGBA, U8YUV is UYVY.
 *
 * The library processes U8G, S16G, U8XYZ, U8XYZA, U8ZYX, U8ZYXA and U8YUV; every other code can be created, copied,
 * cloned, cleared and released only.
 */
enum kelPixelType_e {
    KEL_PIXEL_TYPE_U8G = 0,
    KEL_PIXEL_TYPE_S8G,
    KEL_PIXEL_TYPE_U16G,
    KEL_PIXEL_TYPE_S16G,
    KEL_PIXEL_TYPE_U32G,
    KEL_PIXEL_TYPE_S32G,
    KEL_PIXEL_TYPE_F32G,
    KEL_PIXEL_TYPE_F64G,

    KEL_PIXEL_TYPE_U8XYZ = 8,
    KEL_PIXEL_TYPE_S8XYZ,
    KEL_PIXEL_TYPE_U16XYZ,
    KEL_PIXEL_TYPE_S16XYZ,
    KEL_PIXEL_TYPE_U32XYZ,
    KEL_PIXEL_TYPE_S32XYZ,
    KEL_PIXEL_TYPE_F32XYZ,
    KEL_PIXEL_TYPE_F64XYZ,

    KEL_PIXEL_TYPE_U8XYZA = 16,
    KEL_PIXEL_TYPE_S8XYZA,
    KEL_PIXEL_TYPE_U16XYZA,
    KEL_PIXEL_TYPE_S16XYZA,
    KEL_PIXEL_TYPE_U32XYZA,
    KEL_PIXEL_TYPE_S32XYZA,
    KEL_PIXEL_TYPE_F32XYZA,
    KEL_PIXEL_TYPE_F64XYZA,

    KEL_PIXEL_TYPE_U8ZYX = 24,
    KEL_PIXEL_TYPE_S8ZYX,
    KEL_PIXEL_TYPE_U16ZYX,
    KEL_PIXEL_TYPE_S16ZYX,
    KEL_PIXEL_TYPE_U32ZYX,
    KEL_PIXEL_TYPE_S32ZYX,
    KEL_PIXEL_TYPE_F32ZYX,
    KEL_PIXEL_TYPE_F64ZYX,

    KEL_PIXEL_TYPE_U8ZYXA = 32,
    KEL_PIXEL_TYPE_S8ZYXA,
    KEL_PIXEL_TYPE_U16ZYXA,
    KEL_PIXEL_TYPE_S16ZYXA,
    KEL_PIXEL_TYPE_U32ZYXA,
    KEL_PIXEL_TYPE_S32ZYXA,
    KEL_PIXEL_TYPE_F32ZYXA,
    KEL_PIXEL_TYPE_F64ZYXA,

    KEL_PIXEL_TYPE_U8YUV = 40,
    KEL_PIXEL_TYPE_S8YUV,
    KEL_PIXEL_TYPE_U16YUV,
    KEL_PIXEL_TYPE_S16YUV,
    KEL_PIXEL_TYPE_U32YUV,
    KEL_PIXEL_TYPE_S32YUV,
    KEL_PIXEL_TYPE_F32YUV,
    KEL_PIXEL_TYPE_F64YUV
};

/**
 * One image. Made by createKelImage(), createKelImageHeader() or cloneKelImage() only; its fields never change afterwards,
 * `data` of a header-only image excepted.
 *
 * Pixel (x, y) starts at byte (y * step + x) * channels * depth of `data`. Pixels width .. step-1 of a row are padding:
 * memory of the image that belongs to no pixel. Creation leaves it indeterminate, vector functions may write it, and in some
 * it reaches pixels: contrast stretching, and at some widths YUV to colour, adaptive threshold, 7x7 and the cross operator;
 * each says where. Rows are padded to 16 pixels so that vector functions need no code for row ends.
 */
typedef struct kelImage_t_ {
    kelValue_s32 reserved; /**< Neither written nor read by the library; indeterminate after creation. */
    kelValue_s32 type;     /**< Pixel-type code, as given to creation. */
    kelValue_s32 width;    /**< Pixels in a row. */
    kelValue_s32 height;   /**< Rows. */
    kelValue_s32 channels; /**< Channels of a pixel, 1 to 4; 0 for an unknown type. */
    kelValue_s32 depth;    /**< Bytes of a channel element: 1, 2, 4 or 8; 0 for an unknown type. */
    kelValue_s32 step;     /**< Row pitch in pixels, not bytes: width rounded up to a multiple of 16. */
    kelValue_s32 size;     /**< Bytes of pixel data: channels * depth * height * step. */
    unsigned char* data;   /**< First pixel; 16-byte aligned where the library allocated it. */
    void* buffer;          /**< Heap block behind `data`; owned by the record. */
} kelImage_t;

/**
 * Creates a record without pixels; the caller points `data` at memory of its own, laid out with the record's `step`, and
 * releases the record with releaseKelImageHeader(). `reserved`, `data` and `buffer` are left unset. That memory has to be
 * aligned for its elements (S16G to 2 bytes, four channels of one byte to 4) and no more.
 *
 * Nothing is validated: a type outside 0..47 gives channels, depth and size 0. `step` and `size` are formed in 32-bit
 * arithmetic that wraps. A failed allocation is not detected.
 */
KEL_API kelImage_t* createKelImageHeader(kelValue_s32 width, kelValue_s32 height, kelValue_s32 type);

/**
 * Creates an image that owns `size` bytes of 16-byte aligned, uninitialised pixel data; release it with
 * releaseKelImage(). Validation as createKelImageHeader(); where the pixels cannot be allocated `data` and `buffer` are
 * null.
 */
KEL_API kelImage_t* createKelImage(kelValue_s32 width, kelValue_s32 height, kelValue_s32 type);

/** Frees the record, not its pixels, and nulls the caller's pointer. A null pointer in `*image` is harmless. */
KEL_API void releaseKelImageHeader(kelImage_t** image);

/** Frees the image with its pixels and nulls the caller's pointer. A null pointer in `*image` is harmless. */
KEL_API void releaseKelImage(kelImage_t** image);

/** A new image of the same width, height and type with a copy of all `size` bytes, padding included. */
KEL_API kelImage_t* cloneKelImage(const kelImage_t* src);

/** Copies src->size bytes to dst->data, whatever the two types and sizes are: the destination must have that room. */
KEL_API void copyKelImage(kelImage_t* dst, const kelImage_t* src);

/** Sets all `size` bytes to zero, padding included. */
KEL_API void clearKelImage(kelImage_t* image);

/**
 * Copies a caller's pixels into the top-left corner of an image: min(width, image->width) x min(height, image->height)
 * pixels. `pitch` is the distance of the caller's rows in pixels, not bytes. Pixels outside the copied
 * region, padding included, are left alone. Types U8G, S16G, U8XYZ, U8ZYX, U8XYZA and U8ZYXA; any other copies nothing, and
 * so does a width or height below 1. Nothing is checked.
 */
KEL_API void loadKelImageData(kelImage_t* image, const void* src, kelValue_s32 width, kelValue_s32 height, kelValue_s32 pitch);

/** The mirror of loadKelImageData(): copies the image's top-left corner into the caller's buffer. */
KEL_API void storeKelImageData(void* dst, kelValue_s32 width, kelValue_s32 height, kelValue_s32 pitch, const kelImage_t* image);

/** Inert: returns null. The library reads no files. */
KEL_API KEL_INERT kelImage_t* loadKelImage(const char* path);

/** Inert: does nothing. The library writes no files. */
KEL_API KEL_INERT void storeKelImage(const char* path, const kelImage_t* image);

/* ------------------------------------------------------------------------------------------------------------------
 * Rectangles, colour tables and random numbers
 * ---------------------------------------------------------------------------------------------------------------- */

/**
 * @name Rectangles
 * @{
 */
/**
 * Four values in one of three forms: pp1 (x1, y1, x2, y2) two corners; ps1 (x, y, w, h) corner and size; ps2
 * (cx, cy, w, h) centre and size. The size is the plain difference of the corners. Integer halves truncate toward zero:
 * pp1 to ps2 halves the sum of the corners, ps1 to ps2 halves the size. The four conversions out of ps2 are inert: they do nothing.
 */
KEL_API void kel_rectangle_translate_pp1_to_ps1_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API void kel_rectangle_translate_pp1_to_ps2_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API void kel_rectangle_translate_ps1_to_pp1_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API void kel_rectangle_translate_ps1_to_ps2_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API KEL_INERT void kel_rectangle_translate_ps2_to_pp1_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API KEL_INERT void kel_rectangle_translate_ps2_to_ps1_s32(kelValue_s32* dst, const kelValue_s32* src);
KEL_API void kel_rectangle_translate_pp1_to_ps1_f32(float* dst, const float* src);
KEL_API void kel_rectangle_translate_pp1_to_ps2_f32(float* dst, const float* src);
KEL_API void kel_rectangle_translate_ps1_to_pp1_f32(float* dst, const float* src);
KEL_API void kel_rectangle_translate_ps1_to_ps2_f32(float* dst, const float* src);
KEL_API KEL_INERT void kel_rectangle_translate_ps2_to_pp1_f32(float* dst, const float* src);
KEL_API KEL_INERT void kel_rectangle_translate_ps2_to_ps1_f32(float* dst, const float* src);
/** @} */

/**
 * 216 colours for drawing: the cube of the levels 0, 51, 102, 153, 204, 255. Entry i is 51 * (i / 36), 51 * (i % 6),
 * 51 * ((i / 6) % 6).
 */
KEL_API extern const unsigned char KEL_COLOR_TABLE_SAFE[216][3];

/**
 * 64 colours of a false-colour ramp, R, G, B from dark blue over cyan and yellow to dark red: with t = 4i / 63 channel c
 * is 255 * clamp(1.5 - |t - (3 - c)|), ties rounded up.
 */
KEL_API extern const unsigned char KEL_COLOR_TABLE_PSEUDO[64][3];

/** rand() % x, from 0 to x - 1. Stops the process on "0<x". Shares the generator of rand(). */
KEL_API int KEL_RAND(int x);

/**
 * The sum of twelve draws of rand() % (x + 1) minus 6x: approximately normal, mean 0, standard deviation close to x, within
 * -6x to 6x. Always draws twelve times; x is not checked (-1 divides by zero).
 */
KEL_API int KEL_RAND_NORMAL(int x);

/* ------------------------------------------------------------------------------------------------------------------
 * Pixel conversion
 * ---------------------------------------------------------------------------------------------------------------- */

/**
 * Converts `src` into `dst` of equal width and height by the pair of their types, with the converter of that name:
 *
 * | from \ to  | U8G           | S16G           | U8XYZ           | U8XYZA           | U8ZYX           | U8ZYXA           |
 * |------------|---------------|----------------|-----------------|------------------|-----------------|------------------|
 * | U8G        | copy          | U8G_to_S16G    | U8G_to_U8XYZ    | U8G_to_U8XYZA    | U8G_to_U8XYZ    | U8G_to_U8XYZA    |
 * | S16G       | S16G_to_U8G   | copy           | S16G_to_U8XYZ   | S16G_to_U8XYZA   | S16G_to_U8XYZ   | S16G_to_U8XYZA   |
 * | U8XYZ      | U8XYZ_to_U8G  | U8XYZ_to_S16G  | copy            | U8XYZ_to_U8XYZA  | U8XYZ_to_U8ZYX  | U8XYZ_to_U8XYZA  |
 * | U8XYZA     | U8XYZA_to_U8G | U8XYZA_to_S16G | U8XYZA_to_U8XYZ | copy             | U8XYZA_to_U8ZYX | U8XYZA_to_U8ZYXA |
 * | U8ZYX      | U8XYZ_to_U8G  | U8XYZ_to_S16G  | U8XYZ_to_U8ZYX  | U8XYZ_to_U8XYZA  | copy            | U8XYZ_to_U8XYZA  |
 * | U8ZYXA     | U8XYZA_to_U8G | U8XYZA_to_S16G | U8XYZA_to_U8ZYX | U8XYZA_to_U8ZYXA | U8XYZA_to_U8XYZ | copy             |
 * | U8YUV      | U8YUV_to_U8G  | -              | U8YUV_to_U8BGR  | U8YUV_to_U8BGRA  | U8YUV_to_U8RGB  | U8YUV_to_U8RGBA  |
 *
 * "copy" copies src->size bytes, padding included, and so does U8YUV to U8YUV. The pair marked "-" and any pair that is not
 * listed do nothing.
 *
 * @warning FOUR CHANNELS TO GREY WRITE FAR PAST AN ORDINARY DESTINATION. From U8XYZA or U8ZYXA to U8G or S16G pixel (x, y)
 * lands at element 3 * (y * step + x), where a three-channel image would have it; what lies between is left alone. The
 * destination's data area must hold 3 * step * height elements, three times its `size`. The safe way: convert to U8XYZ (or
 * U8ZYX) first and that to grey.
 *
 * @warning Three channels to four channels of the opposite order (U8XYZ to U8ZYXA, U8ZYX to U8XYZA) KEEP the channel order in
 * memory. To reverse it on the way call convertKelImage_U8XYZ_to_U8ZYXA(). All other pairs of opposite order reverse it.
 *
 * U8YUV to four channels drifts against the rows unless width % 16 is 0, 13, 14 or 15; see the vector converters.
 *
 * Stops the process on "dst->width == src->width && dst->height == src->height".
 */
KEL_API void convertKelImage(kelImage_t* dst, const kelImage_t* src);

/**
 * @name Portable converters
 * @{
 */
/**
 * For each pixel (x, y) of the destination's width and height, rows by either image's own step; s0 .. s3 and d0 .. d3 are the
 * channels in memory order, s a grey source. Nothing is checked: neither types nor sizes. Padding is neither read nor written,
 * YUV and grey sources excepted (below). Where source and destination pixels have equally many bytes both may be the same
 * memory.
 *
 *  - S16G_to_U8G, S16G_to_U8XYZ, S16G_to_U8XYZA: d0 (= d1 = d2) = low 8 bits of abs(s) >> 7: the magnitude by 1/128,
 *    truncated; 32767 gives 255, 127 gives 0, and -32768 gives 0. d3 = 0.
 *  - U8XYZ_to_U8G, U8XYZ_to_S16G: d = (s0 + s1 + s2) / 3, rounded down: the unweighted mean, 0 .. 255 in 16 bits as well (so
 *    the way U8G, S16G, U8G divides by 128).
 *  - U8XYZA_to_U8G, U8XYZA_to_S16G: the same mean, alpha ignored, written to element 3 * (y * step + x). The destination needs
 *    3 * step * height elements: see the warning at convertKelImage().
 *  - U8XYZ_to_U8XYZA: (s0, s1, s2, 0). U8XYZA_to_U8XYZ: (s0, s1, s2).
 *  - U8XYZ_to_U8ZYX, U8XYZA_to_U8ZYX: (s2, s1, s0). U8XYZA_to_U8ZYXA: (s2, s1, s0, s3), the one converter that keeps alpha.
 *  - U8YUV_to_U8RGB writes R, G, B, U8YUV_to_U8BGR writes B, G, R. In single precision, each product and each sum rounded by
 *    the thread's rounding mode, with C = (Y - 16) * 1.164f, U' = U - 128, V' = V - 128:
 *    R = C + 1.793f * V', G = (C + -0.213f * U') + -0.534f * V', B = C + 2.115f * U'; then limited to 0 .. 255 and truncated.
 *    Pixels come in pairs U, Y0, V, Y1. At odd widths the last pair still writes both pixels, the second into the padding, and
 *    THE LAST PIXEL'S V IS READ FROM THE PADDING of the source: fill it, or red and green of that column are anyone's guess.
 *  - The other six forward to the vector converter of the same name, and write the padding as it does.
 */
KEL_API void convertKelImage_S16G_to_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_S16G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_S16G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZ_to_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZ_to_S16G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZ_to_U8ZYX(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZ_to_U8XYZA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZA_to_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZA_to_S16G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZA_to_U8XYZ(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZA_to_U8ZYX(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8XYZA_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8YUV_to_U8RGB(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8YUV_to_U8BGR(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImage_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src);
/** @} */

/**
 * @name Vector converters
 * @{
 */
/**
 * One continuous run through both data areas, of height times the destination's width rounded up to whole blocks; `step` is not
 * read and nothing is checked. Data need no alignment.
 *
 * In blocks of 16 pixels, so that each row covers exactly its padded step, and the padding is converted, too:
 *  - U8G_to_U8XYZ: (s, s, s). U8G_to_U8XYZA: (s, s, s, 0). U8G_to_S16G: s as it is, 0 .. 255.
 *  - U8YUV_to_U8G: the luma byte of each pixel as it is, chroma ignored.
 *
 * In blocks of 4 pixels (8 bytes of the source, 16 of the destination):
 *  - U8YUV_to_U8RGBA writes R, G, B, 0, U8YUV_to_U8BGRA writes B, G, R, 0. As the portable form, with two differences:
 *    G = C + (-0.213f * U' + -0.534f * V'), and the sums are rounded to integers by the thread's rounding mode (to nearest,
 *    ties to even, unless it was changed), then limited to 0 .. 255. So a channel can differ by one from the three-channel form.
 *    At odd widths the last pixel's V is read from the padding, as there.
 *
 * @warning Rows of these two follow each other without a gap, width rounded up to 4 pixels apart, in the source and in the
 * destination. That is the images' own layout only where width % 16 is 0, 13, 14 or 15; at any other width row y is taken
 * from and put to pixel y * (width rounded up to 4) of the data areas.
 *
 * U8YUV_to_U8BGR and U8YUV_to_U8RGB do nothing; the portable ones of these names do the work.
 */
KEL_API void convertKelImageSSE_U8G_to_U8XYZ(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8G_to_U8XYZA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8G_to_S16G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8YUV_to_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8YUV_to_U8RGBA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8YUV_to_U8BGRA(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8YUV_to_U8BGR(kelImage_t* dst, const kelImage_t* src);
KEL_API void convertKelImageSSE_U8YUV_to_U8RGB(kelImage_t* dst, const kelImage_t* src);
/** @} */

/**
 * Reverses the channels and adds alpha: (s2, s1, s0, 0), as the portable converters do it. No route of convertKelImage() comes
 * here. Its symbol carries the parameter types, for C callers too.
 */
#ifdef __cplusplus
extern "C++" KEL_API void convertKelImage_U8XYZ_to_U8ZYXA(kelImage_t* dst, const kelImage_t* src);
#else
KEL_API void
convertKelImage_U8XYZ_to_U8ZYXA(kelImage_t* dst,
                                const kelImage_t* src) __asm__("_Z31convertKelImage_U8XYZ_to_U8ZYXAP11kelImage_t_PKS_");
#endif

/* ------------------------------------------------------------------------------------------------------------------
 * Contrast and binarization
 * ---------------------------------------------------------------------------------------------------------------- */

/**
 * @name Contrast stretching
 * @{
 */
/**
 * Spreads the values of a U8G image linearly over 0 to 255. With the least and the greatest value of the source:
 * d = (s - least) * (255 / (greatest - least)), in single precision, rounded by the thread's rounding mode (to nearest, ties to
 * even, unless it was changed). Where all values are equal d = 0.
 *
 * PADDING TAKES PART: the range is that of whole rows of `step` pixels, and they are written as a whole. Clear or fill the
 * source's padding, or what it holds widens the range: 100 .. 200 with zeros in the padding is stretched as 0 .. 200.
 *
 * adjustKelImage() checks and leaves images of other types than U8G alone; it calls adjustKelImage_U8G(), which calls
 * adjustKelImageSSE_U8G(), and these two check nothing. `dst` and `src` may be the same image.
 *
 * adjustKelImage() stops the process on "dst->type == src->type", then on "dst->width == src->width && dst->height ==
 * src->height".
 */
KEL_API void adjustKelImage(kelImage_t* dst, const kelImage_t* src);
KEL_API void adjustKelImage_U8G(kelImage_t* dst, const kelImage_t* src);
KEL_API void adjustKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src);
/** @} */

/**
 * @name Fixed threshold
 * @{
 */
/**
 * d = 255 where s >= t, else 0, on U8G images; t is the low 8 bits of `threshold`, so 256 acts as 0 and -1 as 255. Whole rows
 * of `step` pixels are written, padding included.
 *
 * binalizeKelImage() checks and leaves images of other types alone; the two it calls check nothing. `dst` and `src` may be the
 * same image.
 *
 * binalizeKelImage() stops the process on "dst->type == src->type", then on "dst->width == src->width && dst->height ==
 * src->height".
 */
KEL_API void binalizeKelImage(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold);
KEL_API void binalizeKelImage_U8G(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold);
KEL_API void binalizeKelImageSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelValue_s32 threshold);
/** @} */

/**
 * @name Adaptive threshold
 * @{
 */
/**
 * d = 255 where s >= m, else 0, on U8G images; m is the mean about the pixel by the kernel (2, 7, 14, 18, 14, 7, 2) / 64 at
 * offsets -12, -8, -4, 0, 4, 8, 12, first along rows from `src` into `tmp`, then down the columns of `tmp`, truncated each time
 * (sum >> 6). A pixel equal to its mean becomes 255.
 *
 * `tmp` is a U8G image of the same size for scratch, other than `src`; it is not checked, and for other types than U8G not even
 * looked at (it may be null there). Its contents afterwards mean nothing.
 *
 * Written are rows 16 .. height-17 and the columns from 16 on, in blocks of 16 as long as a block starts before width - 16.
 * EVERYTHING ELSE KEEPS WHAT `dst` HELD: clear it first where that matters. The means along rows come in blocks of 8, followed
 * by zeros: where width % 16 is 1 .. 8 the last 8 columns written are compared with means of 0 and turn 255. Where width % 8 is
 * 1, 2 or 3 the last means take in up to three pixels of the source's padding. Images of a width or height up to 32 leave `dst`
 * unchanged (and of a width up to 32 `tmp`, too).
 *
 * binalizeKelImageAdaptive() checks and leaves images of other types alone; the two it calls check nothing. `dst` and `src` may
 * be the same image.
 *
 * binalizeKelImageAdaptive() stops the process on "dst->type == src->type", then on "dst->width == src->width && dst->height
 * == src->height".
 */
KEL_API void binalizeKelImageAdaptive(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp);
KEL_API void binalizeKelImageAdaptive_U8G(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp);
KEL_API void binalizeKelImageAdaptiveSSE_U8G(kelImage_t* dst, const kelImage_t* src, kelImage_t* tmp);
/** @} */

/* ------------------------------------------------------------------------------------------------------------------
 * Filters
 * ---------------------------------------------------------------------------------------------------------------- */

/**
 * @name Gaussian 5x5
 * @{
 */
/**
 * Binomial smoothing of a U8G image with w = (1, 4, 6, 4, 1) in both directions, rounded once:
 *
 *     tmp(x, y) = sum w[i] * src(x + i - 2, y)                    0..4080, in columns 2 .. W-3; 0 in the others
 *     dst(x, y) = (sum w[i] * tmp(x, y + i - 2) + 128) >> 8       in columns 2 .. W-3 of rows 2 .. H-3; 0 in the others
 *
 * Every pixel of `dst` is written: a border two pixels wide comes out as zero. `half`, unless it is null, takes every
 * second sample of every second row, half(x/2, y/2) = dst(x, y) for even x and y, zeros of the border included: it needs
 * ceil(W/2) x ceil(H/2) U8G pixels. No padding is written in any image.
 *
 * `tmp` is S16G, at least as wide and high as `src`, and ends up holding the sums above; its size is not checked, nor is
 * anything of `half`. `dst` may be `src`; `tmp` and `half` are images of their own.
 *
 * Other types than U8G return before the type of `tmp` is looked at, and nothing is written. Stops the process on
 *  - "src->data != __null && dst->data != __null && tmp->data != __null"
 *  - "dst->type == src->type && src->width == dst->width && dst->height == src->height"
 *  - "tmp->type == KEL_PIXEL_TYPE_S16G"
 *
 * always from applyKelFilterGaussian5X5_downsampling(), which does the work; applyKelFilterGaussian5X5() passes no `half`.
 */
KEL_API void applyKelFilterGaussian5X5_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp);
KEL_API void applyKelFilterGaussian5X5(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp);
/** @} */

/**
 * @name Gaussian 7x7
 * @{
 */
/**
 * Smoothing of a U8G image with w = (2, 7, 14, 18, 14, 7, 2) / 64 in both directions, rounded after each:
 *
 *     tmp(x, y) = (sum w[i] * src(x + i - 3, y) + 32) >> 6
 *     dst(x, y) = (sum w[i] * tmp(x, y + i - 3) + 32) >> 6
 *
 * Unlike 5x5 it clears no border: what is not listed here keeps its contents.
 *  - `tmp` has the extent of the first pass, whatever `dst` measures, and gets it even where `dst` is too low for the
 *    second. Wider than 16, it is written from column 8 in blocks of 8 while there are more than 8 columns left, followed
 *    by EIGHT ZEROS: columns 8 .. T-9 and zeros in T-8 .. T-1 where T is tmp->width rounded up to a multiple of 8.
 *  - `dst`, wider than 16, is written in rows 3 .. H-4 from column 8 in blocks of 16: columns 8 .. S-9, where S is its step;
 *    the last may lie in the padding. In a width whose remainder by 16 is 1 to 8 the last block reads the zeros in `tmp`:
 *    of a constant image 56 wide, columns 48 .. 55 come out as 0.
 *  - `half`, unless it is null, takes half(x/2, y/2) = dst(x, y) for the even x and y written above: rows 2 .. (H-4)/2,
 *    columns 4 .. S/2-5, followed by EIGHT ZEROS. Where `half` is just ceil(W/2) wide, four of these may lie in the next
 *    row, columns 0 .. 3.
 *
 * `tmp` is U8G and at least as wide and high as `src`; if it is larger, `src` needs memory to be read at the same
 * places. Neither its size nor anything of `half` is checked. In a width whose remainder by 8 is 1 or 2 the last columns
 * take in up to two pixels of the source's padding. `dst` may be `src`; `tmp` and `half` are images of their own.
 *
 * Other types than U8G return before the type of `tmp` is looked at, and nothing is written. Stops the process on
 *  - "src->data != __null && dst->data != __null && tmp->data != __null"
 *  - "dst->type == src->type && src->width == dst->width && dst->height == src->height"
 *  - "tmp->type == KEL_PIXEL_TYPE_U8G"
 *
 * always from applyKelFilterGaussianSSE7X7_downsampling(), which does the work; the names without _downsampling pass no
 * `half`.
 */
KEL_API void applyKelFilterGaussianSSE7X7_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp);
KEL_API void applyKelFilterGaussianSSE7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp);
KEL_API void applyKelFilterGaussian7X7_downsampling(kelImage_t* dst, kelImage_t* half, kelImage_t* src, kelImage_t* tmp);
KEL_API void applyKelFilterGaussian7X7(kelImage_t* dst, kelImage_t* src, kelImage_t* tmp);
/** @} */

/**
 * @name Cross operator
 * @{
 */
/**
 * A Laplacian-like response of a U8G image in an S16G one of the same size. Its neighbours are FIVE pixels away, as the
 * keypoint detector wants them, although the name says 3X3:
 *
 *     dst(x, y) = src(x-5, y) + src(x+5, y) + src(x, y-5) + src(x, y+5) - 4 * src(x, y)        -1020..1020
 *
 * Written are rows 5 .. H-6, columns 8 .. S-9, where S is the step: the last may lie in the padding. Columns from W-5 on take
 * in the source's padding. Everything else keeps its contents. Nothing is written where H < 11 or W <= 16.
 *
 * Another source type returns before the destination's is looked at. Stops the process, always from
 * applyKelFilterLaplacianSSE3X3(), on "dst->step == src->step && dst->width == src->width && dst->height == src->height" and
 * "dst->type == KEL_PIXEL_TYPE_S16G".
 */
KEL_API void applyKelFilterLaplacianSSE3X3(kelImage_t* dst, kelImage_t* src);
KEL_API void applyKelFilterLaplacian3X3(kelImage_t* dst, kelImage_t* src);
/** @} */

/**
 * @name Sobel magnitude
 * @{
 */
/**
 * Gradient magnitude (Irwin Sobel and Gary Feldman, 1968) of a U8G image in an S16G one of the same size:
 *
 *     gx = (left column, weights 1 2 1) - (right column),   gy = (row above, weights 1 2 1) - (row below)
 *     dst(x, y) = round(sqrt(gx^2 + gy^2))                                                      0..1442
 *
 * The root in single precision and the conversion to integers follow the thread's rounding mode: by default to nearest,
 * ties to even.
 *
 * Written are rows 1 .. H-2 and, where W > 32, columns 16 .. R-17 followed by FOUR ZEROS in R-16 .. R-13, R being W rounded
 * up to a multiple of 4; everything else keeps its contents. Nothing is written where H < 3 or W <= 32.
 *
 * Another source type returns before the destination's is looked at. Stops the process, always from
 * applyKelFilterSobelSSE3X3(), on "dst->step == src->step && dst->width == src->width && dst->height == src->height" and
 * "dst->type == KEL_PIXEL_TYPE_S16G".
 */
KEL_API void applyKelFilterSobelSSE3X3(kelImage_t* dst, kelImage_t* src);
KEL_API void applyKelFilterSobel3X3(kelImage_t* dst, kelImage_t* src);
/** @} */

/**
 * Rank filter over the (2n+1) x (2n+1) window of a U8G image: the value of rank 2n(n+1) + 1, counted from 0 in ascending
 * order. That is ONE ABOVE the median: of the nine values of n = 1, the sixth smallest.
 *
 * Every pixel of `dst` is written, with 0 where the window does not fit into the image (a border n wide); padding is not.
 * `dst` must not be `src`. One call of qsort() a pixel: this is simple, not fast. A radius below 1 is not supported and
 * writes nothing. Another source type writes nothing; the destination's type is not looked at.
 * Stops the process on "dst->step == src->step && dst->width == src->width && dst->height == src->height".
 */
KEL_API void applyKelFilterMedianNXN(kelImage_t* dst, kelImage_t* src, kelValue_s32 n);

/** Inert: returns at once. Use applyKelFilterMedianNXN() with n = 1. */
KEL_API KEL_INERT void applyKelFilterMedian3X3(kelImage_t* dst, kelImage_t* src);

/**
 * Adds uniform integer noise to a U8G image: dst = clamp(src - amplitude + rand() % (2 * amplitude + 1), 0, 255).
 *
 * Draws rand() once for every pixel, row by row from left to right, and never for padding: srand() before makes a result
 * repeatable within one thread. Amplitude 0 copies the pixels and draws nothing. `dst` may be `src`. Padding is not written.
 * Other types write and draw nothing. Stops the process on "dst->type == src->type" and
 * "dst->step == src->step && dst->width == src->width && dst->height == src->height".
 */
KEL_API void applyKelFilterNoise(kelImage_t* dst, kelImage_t* src, kelValue_s32 amplitude);

/* ------------------------------------------------------------------------------------------------------------------
 * Keypoints
 * ---------------------------------------------------------------------------------------------------------------- */

/** One detected keypoint. */
typedef struct kelKeypoint2DF32_t_ {
    float x;            /**< Column, sub-pixel. */
    float y;            /**< Row, sub-pixel. */
    kelValue_s32 score; /**< Strength after edge rejection, at least 26. */
    kelValue_s32 tag;   /**< -1 as written by the detector; free for the caller. */
} kelKeypoint2DF32_t;

/**
 * YAPE keypoints: strong, not edge-like local extrema of the cross response L (S16G, applyKelFilterLaplacian3X3()) of a
 * smoothed image G (U8G, applyKelFilterGaussian7X7()), refined to a fraction of a pixel. Point detection on circles after
 * V. Lepetit and P. Fua, "Keypoint recognition using randomized trees", 2006; refinement after M. Brown and D. Lowe,
 * "Invariant features from interest point groups", 2002.
 *
 * Writes the first `max` points, row by row from left to right, to `keypoints` and returns how many there are. Both images
 * are only read. A pixel is a point where
 *  - it is at least 9 pixels from every edge, and the scan comes upon it: in each row it starts at column 9, and after a
 *    column with |L| <= 19 it STEPS OVER THE NEXT ONE. In a flat row columns 9, 11, 13, ... are examined, and a lone
 *    extremum in an even column is missed;
 *  - |L| >= 31, and L is strictly greater (positive L) or strictly less (negative L) than its eight neighbours;
 *  - score = min(|L - e|, |L + e|) >= 26, where e = trunc(sqrt(b^2 + 4 a^2)),
 *    a = G(x+3, y+3) + G(x-3, y-3) - G(x-3, y+3) - G(x+3, y-3) and b = G(x+5, y) + G(x-5, y) - G(x, y-5) - G(x, y+5):
 *    on a straight edge e is as large as |L|.
 *
 * The refinement takes at most five Newton steps to the extremum of the quadratic through 3x3 responses, in single
 * precision, and moves to another pixel, by the truncated step, while a step reaches half a pixel. The LAST STEP IS ADDED TO
 * THE PIXEL ITSELF, not to where the refinement had moved. Where it moves to x <= 9, y <= 9, x >= W-9 or y >= H-9, or the
 * result lies there, the point stays on its pixel.
 *
 * The type of `laplacian` is not checked: it is read as S16G. Another type of `gaussian` returns 0.
 * Stops the process on "gaussian->width == laplacian->width && gaussian->height == laplacian->height".
 */
KEL_API kelValue_s32 applyKelDetectorKeypointYape(kelKeypoint2DF32_t* keypoints, kelValue_s32 max, kelImage_t* gaussian,
                                                  kelImage_t* laplacian);

/* ------------------------------------------------------------------------------------------------------------------
 * Resizing and borders
 * ---------------------------------------------------------------------------------------------------------------- */

/*
 * Types: U8G, S16G, U8XYZ, U8ZYX, U8XYZA, U8ZYXA, moved as whole pixels, unless a function names fewer. Source and
 * destination must be different images. Row padding stays untouched where rows are addressed by `step`.
 *
 * resizeKelImageNearest(), resizeKelImageBilinear(), resizeLinerInterpolation() and zero_order_hold_plus_ave() address
 * pixel (x, y) of either image at element y * width + x of its data, as if rows were densely packed: pictures come out as
 * expected where widths are multiples of 16.
 */

/** Inert: checks the types and resizes nothing. Stops the process on "dst->type == src->type". */
KEL_API KEL_INERT void resizeKelImage(kelImage_t* dst, const kelImage_t* src);

/**
 * Nearest sample at whole-number ratios: dst(x, y) = src(trunc((x + 0.5) rx), trunc((y + 0.5) ry)) with rx = src->width /
 * dst->width and ry = src->height / dst->height, integer divisions. An enlargement has ratio 0 and repeats pixel
 * (0, 0). Rows by `width`, see above. A destination without width or height divides by zero; one of negative size is left alone.
 *
 * Positions are formed in single precision: in sources of 2^23 rows or columns and more they are rounded, and the last may be that
 * behind the source.
 * Stops the process on "dst->type == src->type".
 */
KEL_API void resizeKelImageNearest(kelImage_t* dst, const kelImage_t* src);

/**
 * Bilinear sample of a U8G image at whole-number ratios, at the positions of resizeKelImageNearest() before truncation,
 * rounded half up: even ratios pick one pixel, odd ones average the four from ((x + 0.5) rx, (y + 0.5) ry) on. The neighbour
 * of the last column or row is itself. Rows by `width`, see above. A destination without width or height divides by zero,
 * before the check; one of negative size is left alone. Sources of 2^23 rows or columns and more: as in
 * resizeKelImageNearest(). Other types are ignored. Stops the process on "dst->type == src->type".
 */
KEL_API void resizeKelImageBilinear(kelImage_t* dst, const kelImage_t* src);

/**
 * Keeps the top-left pixel of every 2x2 block, without averaging: dst(x, y) = src(2x, 2y). Rows by `step`.
 * Stops the process on "dst->type == src->type", "dst->width == src->width / 2" and "dst->height == src->height / 2".
 */
KEL_API void resizeKelImageHalf(kelImage_t* dst, const kelImage_t* src);

/**
 * Linear enlargement of four-byte pixels at any ratio, first along rows, then along columns, each step with weights
 * in 1/256 and truncation; destination x lies at source x * src->width / dst->width. The fourth channel of the result is 0.
 *
 * For destinations at least as wide and high as the source. Rows by `width`, see above. THE PIXEL BEHIND THE SOURCE'S
 * LAST IS READ, and takes part in the last columns, as does the next row's first pixel in every other row. Nothing
 * is checked, the types neither.
 */
KEL_API void resizeLinerInterpolation(kelImage_t* dst, const kelImage_t* src);

/**
 * Reduction of four-byte pixels at any ratio by repeating, then averaging: along rows every pixel is repeated a times and every b
 * of those are averaged, a / b = dst->width / src->width in lowest terms; then the same along columns. Each step rounds down. All
 * four channels alike.
 *
 * For destinations not wider than the source. Rows by `width`, see above. Nothing is checked, the types neither.
 */
KEL_API void zero_order_hold_plus_ave(kelImage_t* dst, const kelImage_t* src);

/**
 * Adds a border of `size` pixels (0 or more) on every side that repeats the nearest pixel of the source.
 *
 * U8G and S16G address rows by `step`, types of three and four bytes by `width` (densely packed). For S16G the right border
 * starts at column src->step + size and repeats column src->step + size - 1: with a source width that is no multiple of 16 the
 * true right border stays as it was, and the band lands further on in memory. Where it does not end in the row's padding IT
 * OVERWRITES PIXELS OF THE ROW BEHIND, the first of them its left border, and where size > src->step - src->width the right border
 * as well; it never leaves the rows of `dst`.
 * Stops the process on "dst->type == src->type" and
 * "dst->width == src->width +2*size && dst->height == src->height + 2*size".
 */
KEL_API void resizeKelImageEnborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size);

/**
 * Crops a border of `size` pixels: dst(x, y) = src(x + size, y + size). Rows by `step`.
 * Stops the process on "dst->type == src->type" and
 * "dst->width == src->width - 2*size && dst->height == src->height - 2*size".
 */
KEL_API void resizeKelImageDeborder(kelImage_t* dst, const kelImage_t* src, kelValue_s32 size);

/* ------------------------------------------------------------------------------------------------------------------
 * Flips and warp
 * ---------------------------------------------------------------------------------------------------------------- */

/*
 * Types: U8G, S16G, U8XYZ, U8ZYX, U8XYZA, U8ZYXA, moved as whole pixels; others are ignored. Rows by `step`, padding untouched.
 * Source and destination must be different images. The flips stop the process on "dst->type == src->type" and
 * "dst->width == src->width && dst->height == src->height", the warp on the first only.
 */

/** Mirror: dst(x, y) = src(W-1-x, y). */
KEL_API void rotateKelImageH(kelImage_t* dst, const kelImage_t* src);
/** Flip upside down: dst(x, y) = src(x, H-1-y). */
KEL_API void rotateKelImageV(kelImage_t* dst, const kelImage_t* src);
/** Half turn: dst(x, y) = src(W-1-x, H-1-y). */
KEL_API void rotateKelImageVH(kelImage_t* dst, const kelImage_t* src);

/**
 * Projective warp, nearest sample, zero (in every byte) where nothing maps to. The homography [h0 h1 h2; h3 h4 h5; h6 h7 h8] takes
 * DESTINATION coordinates to SOURCE coordinates: pass the inverse of the transform that the picture should undergo.
 * The images may differ in size.
 *
 * With w = h6 u + h7 v + h8, qx = (h0 u + h1 v + h2) / w and qy = (h3 u + h4 v + h5) / w, in single precision:
 *  - U8G goes through pixel centres: (u, v) = (x + 0.5, y + 0.5), source pixel (trunc(qx), trunc(qy));
 *  - other types go through pixel corners: (u, v) = (x, y), source pixel (trunc(qx + 0.5), trunc(qy + 0.5)).
 * Truncation is toward zero, so that quotients in (-1, 0) count as pixel 0. Quotients that are not finite or that no int holds give
 * zero pixels.
 */
KEL_API void rotateKelImageHomography(kelImage_t* dst, const kelImage_t* src, float h0, float h1, float h2, float h3, float h4,
                                      float h5, float h6, float h7, float h8);

#ifdef __cplusplus
}
#endif

#endif
