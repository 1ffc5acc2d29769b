// Dispatcher, handles, progress and version of the effect library.
#include <cstdint>

#include "../if_utils_and.h"
#include "iel_internal.h"

namespace iel_progress {
std::atomic<uint32_t> busy{0};
std::atomic<uint8_t> cancel_request{0};
std::atomic<uint32_t> done{0};
std::atomic<uint32_t> total{0};
}  // namespace iel_progress

namespace {
// Pointers go into the log as 32-bit words, as they are on the target.
unsigned int word(const void* p) { return static_cast<unsigned int>(reinterpret_cast<uintptr_t>(p)); }

bool dispatcher_accepts(int format) {
  return format == IEL_FORMAT_RGB888 || format == IEL_FORMAT_ARGB_PACK || format == IEL_FORMAT_TYPE4 ||
         format == IEL_FORMAT_TYPE6;
}

bool is_region_effect(int effect) {
  return effect == IEL_EFFECT_REGION_BRIGHTNESS || effect == IEL_EFFECT_REGION_CONTRAST ||
         effect == IEL_EFFECT_REGION_EXPOSURE;
}

// Step 7: the effect's own requirements, then the effect.
int dispatch(structIELImage* input, structIELImage* output, structIELEffectParams* params) {
  const IELEffectEntry* entry = IEL_FindEffect(params->effect);
  if (!entry) {
    IF_ERROR("Unsupported Effect type: %d \n", params->effect);
    return IEL_ERR_NULL;
  }
  if (entry->format != 0 && input->format != entry->format) return IEL_ERR_FORMAT;
  if (entry->effect == IEL_EFFECT_SKETCH_TEXTURE) {
    const structIELImage* texture = params->texture;
    if (!texture) {
      IF_ERROR("Texture image structure in NULL \n");
      return IEL_ERR_NULL;
    }
    if (texture->format != IEL_FORMAT_ARGB_PACK) {
      IF_ERROR("Textrue image format MUST be ARGB(4-byte pack), it is : %d \n", texture->format);
      return IEL_ERR_FORMAT;
    }
    if (texture->width != input->width || texture->height != input->height) {
      IF_ERROR("Textrue image dims(%d x %d) MUST match Input Dims \n", texture->width, texture->height);
      return IEL_ERR_DIMENSION;
    }
  }
  return entry->run(input, output, params);
}
}  // namespace

int IEL_BytesPerPixel(int format) {
  if (format == IEL_FORMAT_RGB565) return 2;
  if (format == IEL_FORMAT_ARGB_PACK) return 4;
  return 3;
}

int IEL_Apply_Effect(structIELImage* input, structIELImage* output, structIELEffectParams* params) {
  if (!input || !output || !params) {
    IF_ERROR("Null parameters: Input = 0x%x Output = 0x%x EffectInit: 0x%x \n", word(input), word(output),
             word(params));
    return IEL_ERR_NULL;
  }
  if (!input->buffer || !output->buffer) {
    IF_ERROR("Null Buffers: Input = %d, Output = %d \n", static_cast<int>(word(input->buffer)),
             static_cast<int>(word(output->buffer)));
    return IEL_ERR_NULL;
  }
  if (!dispatcher_accepts(input->format)) {
    IF_ERROR("Unsupported format: In(%d) \n", input->format);
    return IEL_ERR_FORMAT;
  }
  if (input->width != output->width || input->height != output->height || input->format != output->format) {
    IF_ERROR("Input and Output Mismatch In(%dx%d Fmt:%d ) Out(%dx%d Fmt:%d ): \n", input->width, input->height,
             input->format, output->width, output->height, output->format);
    return IEL_ERR_DIMENSION;
  }
  if (input->format == IEL_FORMAT_TYPE4 || input->format == IEL_FORMAT_TYPE6) {
    if ((input->width & 1) || (input->height & 1) || input->width <= 1 || input->height <= 1) {
      IF_ERROR("Dimensions must be even In(%d x %d) and >1 \n", input->width, input->height);
      return IEL_ERR_DIMENSION;
    }
  }
  if (is_region_effect(params->effect)) {
    if (params->touchX < 0 || params->touchX >= input->width || params->touchY < 0 ||
        params->touchY >= input->height) {
      IF_ERROR("%d :Touch coordinate mismatch error: X: %d, Y: %d, W: %d, H: %d \n", params->effect, params->touchX,
               params->touchY, input->width, input->height);
      return IEL_ERR_DIMENSION;
    }
  }
  int result = dispatch(input, output, params);
  if (result != IEL_OK) {
    const IELEffectEntry* entry = IEL_FindEffect(params->effect);
    bool silent = entry && entry->silent_format_refusal && result == IEL_ERR_FORMAT && input->format != entry->format;
    if (!silent) IF_ERROR("Return code is:  %d \n", result);
  }
  return result;
}

int IEL_CheckEffectImages(const char* function, const structIELImage* input, const structIELImage* output,
                          int min_width, int min_height, bool (*accepts)(int format)) {
  if (!input || !output) {
    if_error_msg(function, __LINE__, "Failed with input image = %d,output image = %d", static_cast<int>(word(input)),
                 static_cast<int>(word(output)));
    return IEL_ERR_NULL;
  }
  if (!input->buffer || !output->buffer) {
    if_error_msg(function, __LINE__, "Failed with input image buffer = %d,output image buffer = %d",
                 static_cast<int>(word(input->buffer)), static_cast<int>(word(output->buffer)));
    return IEL_ERR_NULL;
  }
  if (input->width < min_width || input->height < min_height) {
    if_error_msg(function, __LINE__, "Failed with input image width= %d,input image height = %d", input->width,
                 input->height);
    return IEL_ERR_DIMENSION;
  }
  if (input->format < 1 || input->format > 6 || (accepts && !accepts(input->format))) {
    if_error_msg(function, __LINE__, "Failed with input image format= %d", input->format);
    return IEL_ERR_FORMAT;
  }
  return IEL_OK;
}

void* IEL_Init_Effect(enumIELeffect effect, enumImageFormat, int width, int height) {
  if ((width & 1) || (height & 1)) {
    IF_ERROR("EVEN dimension supported ONLY(%dx%d) \n", width, height);
    return nullptr;
  }
  auto* handle = static_cast<IELEffectHandle*>(IF_CALLOC(sizeof(IELEffectHandle), 1));
  if (!handle) {
    IF_ERROR("Failed to init effect(%d) \n", effect);
    return nullptr;
  }
  if (effect == 14) {
    handle->work = IF_CALLOC(width * 4, 1);
    if (!handle->work) {
      IF_ERROR("Failed to init effect(%d) \n", effect);
      IF_FREE(handle);
      return nullptr;
    }
    handle->work_size = width * 4;
  }
  return handle;
}

void IEL_DeInit_Effect(void** handle) {
  if (!handle) return;
  if (auto* h = static_cast<IELEffectHandle*>(*handle)) {
    if (h->work) {
      IF_FREE(h->work);
      h->work = nullptr;
    }
    IF_FREE(h);
  }
  *handle = nullptr;
}

unsigned int IEL_GetProgress() {
  const uint32_t total = iel_progress::total.load(std::memory_order_acquire);
  if (total == 0) return 0;  // asked before an effect set its total
  const uint64_t percent = static_cast<uint64_t>(iel_progress::done.load(std::memory_order_relaxed)) * 100u / total;
  return percent > 100 ? 100u : static_cast<unsigned int>(percent);
}

void IEL_CancelOperation() {
  if (iel_progress::busy.load() == 1) iel_progress::cancel_request.store(1);
}

const char* IEL_Lib_Version() {
  IF_ERROR("IEL Lib version: %s [%s:%s] \n", "KALO_FXL_PE_ENG_QT13_REL_5.1", "Nov 15 2013", "15:50:20");
  return "KALO_FXL_PE_ENG_QT13_REL_5.1__Nov 15 201315:50:20";
}
