// The dispatcher's table: one row an effect, keyed by identifier. An
// identifier without a row is refused as unsupported.
#include "iel_artistic.h"
#include "iel_effects.h"
#include "iel_internal.h"
#include "iel_variable_blur.h"

namespace {
int level_of(const structIELEffectParams* p) { return p->level ? *p->level : 0; }

const IELEffectEntry kEffects[] = {
    {IEL_EFFECT_SEPIA, IEL_FORMAT_RGB888, true,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_SepiaFast(in, out, level_of(p));
     }},
    {IEL_EFFECT_VARIABLE_BRIGHTNESS, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_VariableBrightness_ARGB8888(in, out, level_of(p));
     }},

    // painterly effects
    {IEL_EFFECT_MAGIC_PEN, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) { return IEL_MagicPenNew_RGB(in, out); }},
    {IEL_EFFECT_SKETCH_TEXTURE, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_Sketch_Texture(in, out, p->texture, 1, 4);
     }},
    {IEL_EFFECT_CARTOON, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_CartoonNew3(in, out, level_of(p));
     }},
    {IEL_EFFECT_POSTERIZE, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) { return IEL_PosterizeNew(in, out); }},
    {IEL_EFFECT_OIL_PAINT, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) { return IEL_OilPaintEdge(in, out); }},

    // end of painterly effects

    // halftone, kaleidoscope, reflection, region and vintage effects
    {IEL_EFFECT_KALEIDOSCOPE, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) {
       return IEL_TriMirrorKaliedoscope_ARGB888(in, out);
     }},
    {IEL_EFFECT_REFLECTION, 0, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_ReflectionEffect(in, out, level_of(p));
     }},
    {IEL_EFFECT_VINTAGE, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) {
       return IEL_Vintage_ARGB_Pack(reinterpret_cast<const uint32_t*>(in->buffer),
                                    reinterpret_cast<uint32_t*>(out->buffer), in->width, in->height);
     }},
    {IEL_EFFECT_HALFTONE, IEL_FORMAT_RGB888, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams*) {
       return IEL_Halftone_Colored_CMYK(in, out);
     }},
    {IEL_EFFECT_REGION_BRIGHTNESS, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_RegionBrightness_ARGB8888(in, out, IEL_AnalyseIntensity_ARGB8888(p->touchX, p->touchY, in),
                                            level_of(p));
     }},
    {IEL_EFFECT_REGION_CONTRAST, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_VariableContrast_ARGB8888(in, out, IEL_AnalyseIntensity_ARGB8888(p->touchX, p->touchY, in),
                                            level_of(p));
     }},
    {IEL_EFFECT_REGION_EXPOSURE, IEL_FORMAT_ARGB_PACK, false,
     [](structIELImage* in, structIELImage* out, structIELEffectParams* p) {
       return IEL_VariableExposure_ARGB8888(in, out, IEL_AnalyseIntensity_ARGB8888(p->touchX, p->touchY, in),
                                            level_of(p));
     }},

    // end of halftone, kaleidoscope, reflection, region and vintage effects

    // variable blur
    {IEL_EFFECT_VARIABLE_BLUR, 0, false, IEL_Apply_VariableBlur},
    // end of variable blur
};
}  // namespace

const IELEffectEntry* IEL_FindEffect(int effect) {
  for (const IELEffectEntry& e : kEffects) {
    if (e.effect == effect) return &e;
  }
  return nullptr;
}
