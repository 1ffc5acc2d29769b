// Byte images of the face engine and the resampling and census helpers that
// the face, eye and mouth detectors share.
#pragma once

#include <cstdint>

// An 8-bit image: width x height pixels of `channels` bytes each, rows top to
// bottom without padding. `data` is owned (smAllocByteImage /
// smReleaseByteImage).
struct caByteImage {
  int width;
  int height;
  int channels;
  unsigned char* data;
};

// Rectangle of the detectors: right and bottom are exclusive (left + width).
struct SMyRect2 {
  int32_t left;
  int32_t top;
  int32_t right;
  int32_t bottom;
};

struct SMyPoint2 {
  int32_t x;
  int32_t y;
};

void smInitByteImage(caByteImage* image);                                   // all zero, no buffer
int smAllocByteImage(caByteImage* image, int width, int height, int channels);  // 1, or 0 on failure
int smCloneByteImage(caByteImage* dst, const caByteImage* src);             // 1, or 0 on failure
// Copies the part of `src` inside `rect` (exclusive right/bottom, clipped to
// the image) into a new `dst`; 0 when nothing is left after clipping.
int smCropImage(const caByteImage* src, caByteImage* dst, SMyRect2 rect);
// Nearest-neighbour resize of any channel count into a new `dst` (Q15 steps).
int smResize(const caByteImage* src, caByteImage* dst, int width, int height);
// Three-channel image to one channel, (R + G + B) / 3.
int smColorToGray(const caByteImage* src, caByteImage* dst);
// Every byte above `threshold` becomes 255, the others 0.
void smThresholdImage(caByteImage* image, int threshold);
void smReleaseByteImage(caByteImage* image);  // frees the buffer, keeps the record
void smFreeByteImage(caByteImage** image);    // frees buffer and a record made by smCreateByteImage
caByteImage* smCreateByteImage();             // zeroed record on the heap, null on failure

// Nearest-neighbour resampling of a grey image with Q15 steps:
// source index = (accumulated step) >> 15, step = (source size << 15) / target size.
void Resize_NN(const unsigned char* src, int srcWidth, int srcHeight, unsigned char* dst, int dstWidth,
               int dstHeight);
// The same sampling of an ARGB picture into grey, (R + G + B) / 3.
void Resize_NN_Color2Gray(const int* argb, int srcWidth, int srcHeight, unsigned char* dst, int dstWidth,
                          int dstHeight);
// Bilinear resampling of a grey image with 8-bit weights: the target pixel x
// samples the source at x * srcWidth / dstWidth (8.8 fixed point), the right
// and lower neighbours clamped to the last column and row.
void Resize_BI(const unsigned char* src, int srcWidth, int srcHeight, unsigned char* dst, int dstWidth,
               int dstHeight);
// Mirrors a grey image left to right in place.
void FlipX(unsigned char* image, int width, int height);

// Census code of every 3 x 3 block: bit k (raster order, 0 top-left .. 8
// bottom-right) is set when 9 * p_k > the block's sum. The walk runs over the
// flat buffer from the centre index width + 1 to width * (height - 1) - 2,
// so the first and last rows are not written and a block centred on the last
// column takes its right column from the next row (and one centred on the
// first column its left column from the row above). Codes 0..510.
void image2MCT_FD(const unsigned char* grey, int width, int height, unsigned short* mct);
// The codes image2MCT_FD writes whose centres lie in rows row0 .. row1 - 1
// (the same flat walk, so the wrap at the row ends is kept); bands of rows
// can be computed independently. image2MCT_FD uses it unless the scalar
// switch is on.
void image2MCT_FD_rows(const unsigned char* grey, int width, int height, int row0, int row1, unsigned short* mct);
// The same code for the eye and mouth detectors.
void image2MCT9_1(const unsigned char* grey, int width, int height, unsigned short* mct);
