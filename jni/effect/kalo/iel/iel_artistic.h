// Painterly, halftone, kaleidoscope, reflection, region and vintage effects
// of the effect library. Every function takes an input and an output image of
// equal size and format and returns an IEL_* result code, unless noted.
#pragma once

#include <cstdint>

#include "iel.h"

// ---- painterly -------------------------------------------------------------

// Cartoon on RGB888: outlines from the local luminance maximum in a
// (2r+1) x (2r+1) window (r = level clamped to 1..4), flattened tones.
int IEL_CartoonNew3(structIELImage* input, structIELImage* output, int level);
// Oil paint on RGB888: edge darkening against a 3x3 Gaussian, then a mode
// filter on 16 luminance levels.
int IEL_OilPaintEdge(structIELImage* input, structIELImage* output);
// 1 2 1 / 2 4 2 / 1 2 1 on each byte of a 3-byte pixel, borders clamped.
int IEL_GaussianBlur(structIELImage* input, structIELImage* output);
// Mode filter: each pixel takes the colour of the first 3x3 neighbour whose
// luminance level (sum >> 14) is the most frequent.
int IEL_OilifyFix(structIELImage* input, structIELImage* output);
// Six levels per channel, stretched by a 1.21 contrast table; reports
// progress by rows and can be cancelled.
int IEL_PosterizeNew(structIELImage* input, structIELImage* output);
// Sobel gradient magnitude of each channel (glowing outlines on black).
int IEL_MagicPenNew_RGB(structIELImage* input, structIELImage* output);
// Colour-dodge pencil drawing; strokeDarkness 1..3, blurLevel 1..2.
int IEL_SketchNew2(structIELImage* input, structIELImage* output, int strokeDarkness, int blurLevel);
// K x K box mean, K = 3, 5, 7, 9, 11 for level 0..4 (and above); borders
// clamped. Reports progress by rows and can be cancelled.
int IEL_Variable_Blur_preview(structIELImage* input, structIELImage* output, unsigned int level);
// Pencil sketch printed on a paper texture (ARGB, input size; its lowest
// byte is read). The two integers are ignored.
int IEL_Sketch_Texture(structIELImage* input, structIELImage* output, structIELImage* texture, int unused1,
                       int unused2);
// Random scatter of ARGB pixels by up to 2^min(amount, 4) - 1 positions.
int IEL_Spread_ARGB(structIELImage* input, structIELImage* output, unsigned char amount);

// ---- region effects (ARGB) --------------------------------------------------

// Step table: pushes a value away from mid-grey (-13 .. +13).
extern const int32_t IEL_StepTable[256];
// Feather weights out of 128 at the edge of a region.
extern const uint8_t IEL_FeatherTable[32];

// 1 when the 5x5 window around (x, y) has a mean intensity (R + B + 2G) / 4
// of 128 or more; 0 otherwise, and always 0 within 2 pixels of a border.
int IEL_AnalyseIntensity_ARGB8888(int x, int y, const structIELImage* image);
int IEL_RegionBrightness_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level);
int IEL_VariableContrast_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level);
// level -7..7, else 1.
int IEL_VariableExposure_ARGB8888(structIELImage* input, structIELImage* output, int bright, int level);

// ---- geometric ---------------------------------------------------------------

// Mirror of the rows above reflectionHeight, fading toward the bottom. The
// height H must satisfy reflectionHeight < H <= 2 * reflectionHeight.
int IEL_ReflectionEffect(structIELImage* input, structIELImage* output, int reflectionHeight);
// Eight-fold mirror pattern of the picture's centre, on white.
int IEL_TriMirrorKaliedoscope_ARGB888(structIELImage* input, structIELImage* output);
// Paints a disc of `inside` around (cx, cy) and `outside` elsewhere (ARGB or
// 3-byte images). Returns a result code.
int IEL_CreateCircularMask(structIELImage* image, int cx, int cy, int radius, structIELPixel inside,
                           structIELPixel outside);

// ---- colour halftone (RGB888) -----------------------------------------------

int IEL_Halftone_Colored_CMYK(structIELImage* input, structIELImage* output);
// Separation into four planes of width * height bytes (256 x + 1.28).
void IEL_Halftone_RGBtoCMYKconversion(const unsigned char* rgb, int width, int height, unsigned char* c,
                                      unsigned char* m, unsigned char* y, unsigned char* k);
// Dot radius for a cell centred on (cx, cy) of `plane`, by channel 1..3.
int IEL_Halftone_AnalyseCircleRadius(const unsigned char* plane, int width, int height, int cx, int cy, int cell,
                                     int channel);
// Screens `plane` into `screen` (255 ink, 0 paper) along lines of `slope`.
void IEL_Halftone_HalftonePerChannel(const unsigned char* plane, unsigned char* screen, int width, int height,
                                     int cell, double slope, int channel);
void IEL_Halftone_CMYKtoRGBconversion(const unsigned char* c, const unsigned char* m, const unsigned char* y,
                                      const unsigned char* k, unsigned char* rgb, int width, int height);
// Every output byte becomes min(output, input).
void IEL_DarkenOnlyBlendingRGB888(const structIELImage* input, structIELImage* output);

// ---- vintage ------------------------------------------------------------------

// Warm, faded film look on 0xAARRGGBB pixels; alpha kept.
int IEL_Vintage_ARGB_Pack(const uint32_t* input, uint32_t* output, int width, int height);
// The three channel curves the vintage look maps red, green and blue through.
void IEL_Vintage_Curves(uint8_t red[256], uint8_t green[256], uint8_t blue[256]);
