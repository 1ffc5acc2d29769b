// The effect library: a self-contained effect engine with its own image
// descriptor, pixel formats, effect identifiers, result codes, progress
// counter and cancellation flag.
//
// Calling it: describe the input and an output of the same size and format as
// structIELImage (the caller owns both buffers), name the effect and its
// parameters in structIELEffectParams and call IEL_Apply_Effect. It returns
// one of the IEL_* result codes; failures are logged under "KALO_PE:".
// IEL_GetProgress and IEL_CancelOperation may be called from another thread
// while an effect runs. One effect runs at a time in the process.
#pragma once

#include <cstdint>

enum enumImageFormat : int16_t {
  IEL_FORMAT_RGB565 = 1,     // one 16-bit word: R 15-11, G 10-5, B 4-0
  IEL_FORMAT_RGB888 = 2,     // 3 bytes: R, G, B
  IEL_FORMAT_ARGB_PACK = 3,  // one 32-bit word 0xAARRGGBB
  IEL_FORMAT_TYPE4 = 4,      // w*h*3/2 bytes: a full-size plane and subsampled planes
  IEL_FORMAT_TYPE5 = 5,      // known to the effects' own checks, refused by the dispatcher
  IEL_FORMAT_TYPE6 = 6,      // as type 4
};

enum enumIELeffect : int16_t {
  IEL_EFFECT_MAGIC_PEN = 2,
  IEL_EFFECT_SKETCH_TEXTURE = 3,
  IEL_EFFECT_CARTOON = 4,
  IEL_EFFECT_POSTERIZE = 5,
  IEL_EFFECT_OIL_PAINT = 6,
  IEL_EFFECT_SEPIA = 11,
  IEL_EFFECT_KALEIDOSCOPE = 12,
  IEL_EFFECT_REFLECTION = 13,
  IEL_EFFECT_VINTAGE = 18,
  IEL_EFFECT_HALFTONE = 24,
  IEL_EFFECT_REGION_BRIGHTNESS = 35,
  IEL_EFFECT_REGION_CONTRAST = 36,
  IEL_EFFECT_REGION_EXPOSURE = 37,
  IEL_EFFECT_VARIABLE_BLUR = 38,
  IEL_EFFECT_VARIABLE_BRIGHTNESS = 39,
};

// Result codes of the dispatcher and of every effect.
enum {
  IEL_OK = 0,
  IEL_ERR_NULL = 1,         // null descriptor, buffer or texture; unsupported effect
  IEL_ERR_ALLOC = 2,        // an allocation inside an effect failed
  IEL_ERR_DIMENSION = 3,    // size mismatch, odd or too small sizes, touch outside
  IEL_ERR_FORMAT = 4,       // unsupported format
  IEL_ERR_CANCELLED = 5,    // stopped by IEL_CancelOperation
};

struct structIELImage {
  int32_t width;
  int32_t height;
  int16_t format;  // enumImageFormat
  unsigned char* buffer;
};

struct structIELEffectParams {
  int16_t effect;             // enumIELeffect
  int32_t* level;             // the effect's one integer parameter; null where unused
  structIELImage* texture;    // sketch-with-texture only
  int32_t touchX;             // region effects only
  int32_t touchY;
};

// Filled by callers that want a particular pixel painted (circular masks).
struct structIELPixel {
  unsigned char r, g, b, a;
};

// Optional handle: a work buffer (effect 14 only, width * 4 bytes), its size
// and a word that stays zero. The dispatcher does not use it.
struct IELEffectHandle {
  void* work;
  int32_t work_size;
  int32_t reserved;
};

void* IEL_Init_Effect(enumIELeffect effect, enumImageFormat format, int width, int height);
void IEL_DeInit_Effect(void** handle);
int IEL_Apply_Effect(structIELImage* input, structIELImage* output, structIELEffectParams* params);
unsigned int IEL_GetProgress();
void IEL_CancelOperation();
const char* IEL_Lib_Version();

// Bytes per pixel of a format: 2 for RGB565, 4 for ARGB_PACK, else 3.
int IEL_BytesPerPixel(int format);
