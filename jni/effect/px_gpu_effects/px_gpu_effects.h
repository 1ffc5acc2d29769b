// Shader-style effects: each visits every pixel once, works on its colour in
// floating point with small shader helpers and writes it back, keeping the
// alpha of the pixel it recolours.
//
// Whole-picture forms take (input, output, [textures...], width, height);
// partial forms (input, mask, output, [textures...], width, height, left,
// right, top, bottom). Textures are pictures of the picture's size. A partial
// form runs the whole form into a scratch picture and copies it to the output
// where the mask byte is exactly 1 inside the rectangle (clipped to the
// picture), or everywhere for an empty rectangle; other output pixels are not
// written. On an allocation failure the member's message is logged and the
// output is not written. The members that read neighbours or move pixels
// (rugged, oil pastel, impressionist) need an output distinct from the input.
#pragma once

// ---- helpers ---------------------------------------------------------------

// m = a if a > lo else lo; m if m < hi else hi (NaN gives lo).
float clamp(float a, float lo, float hi);
// t = clamp((x - e0) / (e1 - e0), 0, 1) in single precision; t * t * (3 - 2t).
double smoothstep(double e0, double e1, double x);
// 0 if x < edge, else 1.
double step(double edge, double x);
double length(double x, double y);
double flength(float x, float y);

// smoothstep with the division by e1 - e0 replaced by a multiplication by
// `inverse` = 1 / (e1 - e0), for fast paths: the same value only where a test
// checks it for every x the operation can meet. Gothic noir's luma and
// redness smoothsteps take it (checked for every colour and every pair of
// channel values).
inline double smoothstep_by_inverse(double e0, double inverse, double x) {
  const float a = static_cast<float>((x - e0) * inverse);
  const float m = a > 0.0f ? a : 0.0f;
  const double t = m < 1.0f ? m : 1.0f;
  return t * t * (3.0 - 2.0 * t);
}
inline constexpr double kNoirLumaInverse = 1.0 / (0.78 - 0.12);
inline constexpr double kNoirRednessInverse = 1.0 / (0.45 - 0.25);

// ---- members ---------------------------------------------------------------

void gpu_Turquoise(int* in, int* out, int width, int height);
void gpu_rainbow(int* in, int* out, int width, int height);
void gpu_gothicnoir(int* in, int* out, int width, int height);
void gpu_vignette(int* in, int* out, int width, int height);
void gpu_rugged(int* in, int* out, int* grain, int width, int height);
void gpu_oilPastel(int* in, int* out, int* grain, int width, int height);
void gpu_noirNote(int* in, int* out, int* grain, int width, int height);
void gpu_impressionist(int* in, int* out, int* strokes, int* canvas, int width, int height);
void gpu_stucchevole(int* in, int* out, int* glow, int* paper, int* sparkle, int width, int height);

void gpu_Turquoise_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                           int top, int bottom);
void gpu_rainbow_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,
                         int bottom);
void gpu_gothicnoir_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                            int top, int bottom);
void gpu_vignette_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                          int top, int bottom);
void gpu_rugged_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                        int right, int top, int bottom);
void gpu_oilPastel_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                           int right, int top, int bottom);
void gpu_noirNote_partial(int* in, unsigned char* mask, int* out, int* grain, int width, int height, int left,
                          int right, int top, int bottom);
void gpu_impressionist_partial(int* in, unsigned char* mask, int* out, int* strokes, int* canvas, int width,
                               int height, int left, int right, int top, int bottom);
void gpu_stucchevole_partial(int* in, unsigned char* mask, int* out, int* glow, int* paper, int* sparkle, int width,
                             int height, int left, int right, int top, int bottom);
