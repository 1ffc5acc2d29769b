package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;

import java.util.Arrays;
import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The effect-library methods as Java sees them: families A, B, C and E. */
class EffectsTest {
    static final int W = 24;
    static final int H = 18;

    static int[] picture(long seed, int n) {
        return TestPictures.random(n, seed);
    }

    static int[] picture(long seed) {
        return picture(seed, W * H);
    }

    @FunctionalInterface
    interface Whole {
        int call(int[] in, int[] out, int width, int height);
    }

    @FunctionalInterface
    interface Partial {
        int call(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);
    }

    static final Whole[] WHOLE = {Engine::applyCartoonize, Engine::applyMagicPen, Engine::applyOilpaint,
            Engine::applyPosterize, Engine::applySketch, Engine::applyHalftone,
            (in, out, w, h) -> Engine.applySketchTexture(in, picture(9, w * h), out, w, h)};
    static final Partial[] PARTIAL = {Engine::applyCartoonizePartial, Engine::applyMagicPenPartial,
            Engine::applyOilpaintPartial, Engine::applyPosterizePartial, Engine::applySketchPartial,
            Engine::applyHalftonePartial,
            (in, m, out, w, h, r) -> Engine.applySketchTexturePartial(in, picture(9, w * h), out, m, w, h, r)};

    @Nested
    class PackedRgbFamilies {
        @Test
        void refusedArgumentsGiveErrNullAndLeaveTheOutput() {
            int[] in = picture(1);
            for (Whole m : WHOLE) {
                int[] out = new int[W * H];
                assertEquals(Engine.ERR_NULL, m.call(null, out, W, H));
                assertEquals(Engine.ERR_NULL, m.call(in, null, W, H));
                assertEquals(Engine.ERR_NULL, m.call(in, new int[W * H - 1], W, H));
                assertEquals(Engine.ERR_NULL, m.call(in, out, 0, H));
                assertArrayEquals(new int[W * H], out);
            }
            assertEquals(Engine.ERR_NULL, Engine.applySketchTexture(in, null, new int[W * H], W, H));
            assertEquals(Engine.ERR_NULL, Engine.applySketchTexture(in, new int[3], new int[W * H], W, H));
            assertEquals(Engine.ERR_NULL,
                    Engine.applySketchTexturePartial(in, null, new int[W * H], null, W, H, Rect.whole()));
        }

        @Test
        void alphaComesFromTheInput() {
            int[] in = picture(2);
            for (Whole m : WHOLE) {
                int[] out = new int[W * H];
                assertEquals(Engine.SUCCESS, m.call(in, out, W, H));
                for (int i = 0; i < in.length; i++) {
                    assertEquals(in[i] >>> 24, out[i] >>> 24);
                }
            }
        }

        @Test
        void posterizeOfKnownColours() {
            int[] in = {0x80_2A2BFF, 0x00_000000};
            int[] out = new int[2];
            assertEquals(Engine.SUCCESS, Engine.applyPosterize(in, out, 2, 1));
            assertArrayEquals(new int[] {0x80_0019E9, 0x00_000000}, out);
        }

        @Test
        void partialFormsMergeByMaskAndMatchTheWholeForm() {
            int[] in = picture(3);
            byte[] mask = new byte[W * H];
            mask[5 * W + 6] = 1;
            mask[5 * W + 7] = 2;  // only 1 selects
            mask[0] = 1;          // outside the rectangle: the rectangle does not bound the merge
            Rect rect = new Rect(4, 4, 10, 10);
            for (int k = 0; k < WHOLE.length; k++) {
                int[] whole = new int[W * H];
                assertEquals(Engine.SUCCESS, WHOLE[k].call(in, whole, W, H));
                int[] out = new int[W * H];
                assertEquals(Engine.SUCCESS, PARTIAL[k].call(in, mask, out, W, H, rect));
                for (int i = 0; i < in.length; i++) {
                    assertEquals(mask[i] == 1 ? whole[i] : in[i], out[i], "method " + k + " pixel " + i);
                }
                int[] all = new int[W * H];
                assertEquals(Engine.SUCCESS, PARTIAL[k].call(in, null, all, W, H, Rect.whole()));
                assertArrayEquals(whole, all);
                assertEquals(Engine.ERR_NULL, PARTIAL[k].call(in, null, out, W, H, rect));
            }
        }

        @Test
        void sketchOfAFlatPictureIsPaper() {
            int[] in = new int[W * H];
            Arrays.fill(in, 0x33_5A5A5A);
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applySketch(in, out, W, H));
            for (int v : out) {
                assertEquals(0x33_FCFCFC, v);  // stroke darkness 2: 255 -> 254 -> 252
            }
        }
    }

    @Nested
    class Cancellation {
        @Test
        void cancelFromAnotherThreadStopsPosterizeAndLeavesTheOutput() throws Exception {
            int w = 2400;
            int h = 2000;
            int[] in = picture(4, w * h);
            int[] out = new int[w * h];
            // The effect takes a few milliseconds: on a busy machine every cancel
            // may miss it, and then it has simply finished. It is run again until
            // one lands (the output written by a finished run is put back first).
            boolean cancelled = false;
            for (int attempt = 0; attempt < 20 && !cancelled; attempt++) {
                Arrays.fill(out, 0x01020304);
                AtomicInteger rc = new AtomicInteger();
                Thread worker = new Thread(() -> rc.set(Engine.applyPosterize(in, out, w, h)));
                worker.start();
                while (worker.isAlive()) {
                    Engine.cancelEffect();
                    int p = Engine.getEffectProgress();
                    assertEquals(true, p >= 0 && p <= 100);
                }
                worker.join();
                if (rc.get() == Engine.SUCCESS) {
                    continue;
                }
                assertEquals(Engine.ERR_EFFECT, rc.get());
                for (int v : out) {
                    assertEquals(0x01020304, v);
                }
                cancelled = true;
            }
            assertEquals(true, cancelled);
            // A request that raced the effect's end is consumed by the next effect.
            Engine.applyPosterize(new int[1], new int[1], 1, 1);
            int[] small = new int[1];
            assertEquals(Engine.SUCCESS, Engine.applyPosterize(new int[] {0xFF000000}, small, 1, 1));
        }
    }

    @Nested
    class ArgbFamilies {
        @Test
        void kaleidoscopeAndReflectionReportSuccessEvenWhenTheEffectRefuses() {
            int[] in = picture(5);
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyKaleidoscope(in, out, W, H));
            assertEquals(0xFFFFFFFF, out[W - 1]);  // outside the square: white
            int[] untouched = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyReflection(in, untouched, W, H, H));  // height not > H
            assertArrayEquals(new int[W * H], untouched);
            assertEquals(Engine.ERR_NULL, Engine.applyKaleidoscope(null, out, W, H));
            assertEquals(Engine.ERR_NULL, Engine.applyReflection(in, new int[2], W, H, 10));
        }

        @Test
        void reflectionMirrorsBelowTheBoundary() {
            int[] in = picture(6);
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applyReflection(in, out, W, H, 10));
            for (int i = 0; i < 10 * W; i++) {
                assertEquals(in[i], out[i]);
            }
            for (int i = 10 * W; i < W * H; i++) {
                assertEquals(0xFF, out[i] >>> 24);
            }
        }

        @Test
        void regionMethodsReturnTheLibraryCode() {
            int[] in = new int[W * H];
            Arrays.fill(in, 0x40_3C3C3C);
            int[] out = new int[W * H];
            assertEquals(0, Engine.applyRegionBasedBrightness(in, out, W, H, 5, 5, 4));
            assertEquals(0xFF_505050, out[0]);  // dark touch: +5 * 4, opaque
            assertEquals(0, Engine.applyRegionBasedContrast(in, out, W, H, 5, 5, 1));
            assertEquals(0xFF_353535, out[0]);  // step(60) = -7
            assertEquals(3, Engine.applyRegionBasedExposure(in, out, W, H, W, 0, 2));
            assertEquals(1, Engine.applyRegionBasedExposure(in, out, W, H, 5, 5, 8));
            assertEquals(Engine.ERR_NULL, Engine.applyRegionBasedBrightness(in, null, W, H, 5, 5, 4));
        }

        @Test
        void vintageKeepsAlphaAndIgnoresRefusedArguments() {
            int[] in = {0x00_000000, 0x7F_FFFFFF};
            int[] out = new int[2];
            Engine.applyVintage(in, out, 2, 1);
            assertArrayEquals(new int[] {0x00_2B0D0D, 0x7F_F0EEEE}, out);
            int[] untouched = new int[2];
            Engine.applyVintage(in, untouched, 2, 2);
            Engine.applyVintage(null, untouched, 2, 1);
            assertArrayEquals(new int[2], untouched);
        }
    }
}
