// Pictures between files and images: PNG, JPEG (turned as its EXIF orientation says), binary PGM and PPM in; PNG and JPEG out.
// Every failure is an Error whose text names the file.
#ifndef KEL_EXAMPLES_PICTURE_H
#define KEL_EXAMPLES_PICTURE_H

#include <cstdint>
#include <kel/kelImage.hpp>
#include <string>
#include <vector>

#include "Output.h"

namespace kel_examples {

using kel::Image;

// Decodes a picture in memory to RGB (U8ZYX). `name` stands in the errors.
Image decodePicture(const uint8_t* bytes, size_t size, const std::string& name);

// Reads a picture file to RGB (U8ZYX). At least 2 pixels and at most 16384 either way, 2^27 in all.
Image readPicture(const std::string& path);

// Writes U8ZYX or U8G as PNG, through an Output; encoded for speed rather than for size.
void writePicture(const std::string& path, const Image& image);

// U8ZYX as the bytes of a JPEG file, for pages that hold their pictures.
std::vector<uint8_t> encodeJpeg(const Image& image);

// The picture's grey values (the mean of its channels), padding filled with each row's last pixel.
Image greyOf(const Image& picture);

} // namespace kel_examples

#endif
