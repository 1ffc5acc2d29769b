package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.BeforeEach;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** Backlight correction through the bridge: the analysis kept between calls, result codes, the correction. */
class BacklightTest {
    static final int W = 120;
    static final int H = 90;

    static boolean subject(int x, int y, int w, int h) {
        double dx = (x - 0.5 * w) / (0.25 * w);
        double dy = (y - 0.65 * h) / (0.4 * h);
        return dx * dx + dy * dy <= 1;
    }

    /** A dark textured subject against a bright sky; alpha varies. */
    static int[] backlit(int w, int h, long seed) {
        Random r = new Random(seed);
        int[] p = new int[w * h];
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                int n = r.nextInt(17) - 8;
                int a = 0x40 + (x * 7 + y) % 192;
                int rgb = subject(x, y, w, h)
                        ? (50 + n) << 16 | (40 + n) << 8 | (30 + n)
                        : (190 + n / 2) << 16 | (215 + n / 2) << 8 | 245;
                p[y * w + x] = a << 24 | rgb;
            }
        }
        return p;
    }

    static int luma(int p) {
        return (299 * ((p >> 16) & 255) + 587 * ((p >> 8) & 255) + 114 * (p & 255)) / 1000;
    }

    static int[] filled(int n, int value) {
        int[] p = new int[n];
        Arrays.fill(p, value);
        return p;
    }

    @BeforeEach
    @AfterEach
    void freeAnalysis() {
        assertEquals(0, Engine.DeInitBLC());
    }

    @Nested
    class LifeCycle {
        final int[] in = backlit(W, H, 1);

        @Test
        void renderingBeforeInitDoesNothing() {
            int[] out = filled(W * H, 7);
            assertEquals(Engine.ERR_NULL, Engine.applyGammaTransformPreview(in, out, W, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(in, out, W, H, 50));
            assertArrayEquals(filled(W * H, 7), out);
        }

        @Test
        void fullSequenceThenRenderingAfterDeInitIsRefused() {
            int[] preview = new int[W * H];
            int[] saved = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            assertEquals(Engine.SUCCESS, Engine.applyGammaTransformPreview(in, preview, W, H, 40));
            assertEquals(Engine.SUCCESS, Engine.applyGammaTransformPreview(in, preview, W, H, 70));
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, saved, W, H, 70));
            assertArrayEquals(saved, preview);
            assertEquals(0, Engine.DeInitBLC());
            assertEquals(0, Engine.DeInitBLC());
            int[] out = filled(W * H, 7);
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(in, out, W, H, 70));
            assertArrayEquals(filled(W * H, 7), out);
        }

        @Test
        void secondInitReplacesTheFirst() {
            int[] flat = filled(W * H, 0xFF808080);
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(flat, W, H));
            // The flat picture is not backlit: the backlit one now goes through unchanged.
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, out, W, H, 100));
            assertArrayEquals(in, out);
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, out, W, H, 100));
            assertTrue(luma(out[(H * 65 / 100) * W + W / 2]) > luma(in[(H * 65 / 100) * W + W / 2]) + 30);
        }

        @Test
        void refusedInitKeepsTheEarlierAnalysis() {
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            assertEquals(Engine.ERR_NULL, Engine.autoBLCInit(null, W, H));
            assertEquals(Engine.ERR_NULL, Engine.autoBLCInit(new int[10], W, H));
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, out, W, H, 100));
        }
    }

    @Nested
    class Arguments {
        final int[] in = backlit(W, H, 2);

        @BeforeEach
        void init() {
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
        }

        @Test
        void nullShortArraysAndBadSizesAreRefusedUntouched() {
            int[] out = filled(W * H, 7);
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(null, out, W, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(in, null, W, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyGammaTransformPreview(in, new int[W * H - 1], W, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyGammaTransformPreview(Arrays.copyOf(in, 5), out, W, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(in, out, 0, H, 50));
            assertEquals(Engine.ERR_NULL, Engine.applyBLCSave(in, out, W, -3, 50));
            assertEquals(Engine.ERR_NULL, Engine.autoBLCInit(in, W, 0));
            assertArrayEquals(filled(W * H, 7), out);
        }

        @Test
        void strengthIsClamped() {
            int[] zero = new int[W * H];
            int[] full = new int[W * H];
            int[] over = new int[W * H];
            Engine.applyBLCSave(in, zero, W, H, -10);
            Engine.applyBLCSave(in, full, W, H, 100);
            Engine.applyBLCSave(in, over, W, H, 1000);
            assertArrayEquals(in, zero);
            assertArrayEquals(full, over);
        }

        @Test
        void inputMayBeTheOutput() {
            int[] expected = new int[W * H];
            Engine.applyBLCSave(in, expected, W, H, 60);
            int[] pic = in.clone();
            assertEquals(Engine.SUCCESS, Engine.applyGammaTransformPreview(pic, pic, W, H, 60));
            assertArrayEquals(expected, pic);
        }
    }

    @Nested
    class Correction {
        @Test
        void darkSubjectBrightensSkyStaysWithinAFewLevelsAlphaKept() {
            int[] in = backlit(W, H, 3);
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, out, W, H, 100));
            long before = 0;
            long after = 0;
            int n = 0;
            for (int y = 0; y < H; y++) {
                for (int x = 0; x < W; x++) {
                    int i = y * W + x;
                    assertEquals(in[i] & 0xFF000000, out[i] & 0xFF000000, "alpha at " + i);
                    if (subject(x, y, W, H)) {
                        before += luma(in[i]);
                        after += luma(out[i]);
                        n++;
                    } else {
                        for (int sh = 0; sh <= 16; sh += 8) {
                            int d = Math.abs(((in[i] >> sh) & 255) - ((out[i] >> sh) & 255));
                            assertTrue(d <= 6, "sky changed by " + d + " at " + x + "," + y);
                        }
                    }
                }
            }
            assertTrue(after > before + 40L * n, "subject mean " + before / n + " -> " + after / n);
        }

        @Test
        void displayCopyOfOtherSizeIsCorrectedToo() {
            int[] full = backlit(4 * W, 4 * H, 4);
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(full, 4 * W, 4 * H));
            int[] small = backlit(W, H, 5);
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyGammaTransformPreview(small, out, W, H, 100));
            int centre = (H * 65 / 100) * W + W / 2;
            assertTrue(luma(out[centre]) > luma(small[centre]) + 40);
            assertTrue(Math.abs(luma(out[0]) - luma(small[0])) <= 6);
        }

        @Test
        void pictureWithoutBacklightIsUnchanged() {
            Random r = new Random(6);
            int[] in = new int[W * H];
            for (int i = 0; i < in.length; i++) {
                int v = 110 + (i % W) * 40 / W + r.nextInt(21) - 10;
                in[i] = 0xFF000000 | v << 16 | v << 8 | v;
            }
            assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyBLCSave(in, out, W, H, 100));
            assertArrayEquals(in, out);
        }
    }
}
