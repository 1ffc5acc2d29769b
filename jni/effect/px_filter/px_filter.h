// Filters: texture overlays and tone-curve looks on 0xAARRGGBB pictures.
//
// Every filter is a chain of the engine's whole-picture adjustments: the
// first step reads the input and writes the output, every later step works
// in place on the output (so `in` may equal `out`). Textures are pictures of
// exactly the picture's size, supplied by the caller.
//
// Partial forms (mask, rectangle as left, right, top, bottom, inclusive):
// the filter is run on the whole picture into a working picture; when the
// rectangle is not empty only the pixels of the rectangle whose mask byte is
// exactly 1 are copied to the output and every other output pixel keeps what
// the output held before the call; an empty rectangle (right < left or
// bottom < top) copies the whole working picture. The caller therefore passes
// an output that already holds the current picture. If the working picture
// cannot be allocated, the failure is logged and the output is not written.
#pragma once

#include <cstdint>

// ---- texture overlays ------------------------------------------------------

void px_apply_dawncast_texture(int* in, int* out, int* overlay, int* screen, int width, int height);
void px_apply_lightstreak_texture(int* in, int* out, int* texture, int width, int height);
void px_apply_stardust_texture(int* in, int* out, int* texture, int width, int height);
void px_apply_sunburst_texture(int* in, int* out, int* texture, int width, int height);
void px_apply_lightflare_texture(int* in, int* out, int* texture, int width, int height);
void px_apply_oldphoto_texture(int* in, int* out, int* texture, int width, int height);

// Screen: 255 - ((255 - c) * (255 - t) >> 8) per channel (0 with 0 gives 1),
// image alpha kept; a pixel whose image alpha is 0 becomes the word 0.
void px_blend_texture_with_screen(int* image, int* out, int* texture, int width, int height);
// Overlay with the texture's alpha ta mixed by the XOR form
// (ta * o + c * (ta ^ ia)) >> 8; image alpha ia kept; ia = 0 gives the word 0.
void px_blend_texture_with_overlay(int* image, int* out, int* texture, int width, int height);

void px_apply_dawncast_texture_partial(int* in, int* out, int* overlay, int* screen, unsigned char* mask, int width,
                                       int height, int left, int right, int top, int bottom);
void px_apply_lightstreak_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width,
                                          int height, int left, int right, int top, int bottom);
void px_apply_stardust_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width, int height,
                                       int left, int right, int top, int bottom);
void px_apply_sunburst_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width, int height,
                                       int left, int right, int top, int bottom);
void px_apply_lightflare_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width,
                                         int height, int left, int right, int top, int bottom);
void px_apply_oldphoto_texture_partial(int* in, int* out, int* texture, unsigned char* mask, int width, int height,
                                       int left, int right, int top, int bottom);

// ---- tone curves -----------------------------------------------------------

void px_apply_retro(int* in, int* out, int width, int height);
void px_apply_yellowglow(int* in, int* out, int width, int height);
void px_apply_nostalgia(int* in, int* out, int width, int height);
void px_apply_bluewash(int* in, int* out, int width, int height);
void px_apply_sunshine(int* in, int* out, int width, int height);
void px_apply_vintage(int* in, int* out, int width, int height);
void px_apply_vintage_prev(int* in, int* out, int width, int height);
void px_apply_oldphoto(int* in, int* out, int width, int height);
void px_apply_downlight(int* in, int* out, int width, int height);
void px_apply_popart(int* in, int* out, int width, int height);
void px_apply_popart_prev(int* in, int* out, int width, int height);
void px_softglow(int* in, int* out, int width, int height);

void px_apply_retro_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                            int top, int bottom);
void px_apply_yellowglow_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                                 int top, int bottom);
void px_apply_nostalgia_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                                int top, int bottom);
void px_apply_bluewash_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                               int top, int bottom);
void px_apply_sunshine_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                               int top, int bottom);
void px_apply_vintage_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                              int top, int bottom);
void px_apply_oldphoto_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                               int top, int bottom);
void px_apply_downlight_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right,
                                int top, int bottom);
void px_softglow_partial(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,
                         int bottom);

// Sepia tables of the old-photo look: the red and blue a grey level v turns
// into (green stays v). Black and white stay neutral; the middle greys warm.
int px_get_sepia_r(int v);
int px_get_sepia_b(int v);

// Gamma curve: entry i = clamp(trunc(255 * (i / 255)^(1 / gamma) + 0.5)),
// applied to channel 0 = red, green and blue, 1 = red, 2 = green, 3 = blue.
void control_gamma(int* in, int* out, int width, int height, int channel, double gamma);
void px_make_gamma_table(double gamma, uint8_t table[256]);

// v = (R + B + 2G) >> 2 on every colour channel, alpha kept.
void px_apply_greyscale_all(int* in, int* out, int width, int height);

// Darkens towards the frame: 9/16 of the value at the middle of each edge,
// 1/8 at the corners. Pictures narrower or lower than 2 pixels are copied.
void px_apply_vignette(int* in, int* out, int width, int height);

// Horizontal sharpen: 2c - ((left + right) >> 1), clamped; the first and last
// pixel of each row are copied.
void px_apply_sharpen_all(int* in, int* out, int width, int height);
// Sharpens the pixels whose mask byte is 1 (anywhere in the picture) and
// copies the others. With an empty rectangle the caller's whole mask is first
// set to 1, every pixel is sharpened, and the mask is left all 0.
void px_apply_sharpen(int* in, unsigned char* mask, int* out, int width, int height, int left, int right, int top,
                      int bottom);
