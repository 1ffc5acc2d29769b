// The dispatcher's table: one row an effect, keyed by identifier. An
// identifier without a row is refused as unsupported.
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

    // end of painterly effects

    // halftone, kaleidoscope, reflection, region and vintage effects

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
