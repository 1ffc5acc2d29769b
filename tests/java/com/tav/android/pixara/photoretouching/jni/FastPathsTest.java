package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;

import java.util.Random;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/**
 * Engine methods whose bridge or engine work has a fast path (row bands, one packed RGB buffer for the
 * effects that run in place, fused chains), each against the plain path of the scalar switch: the
 * same result arrays, inputs untouched.
 */
class FastPathsTest {
    /** 1 x N, N x 1, odd widths, enough rows for several bands. */
    static final int[][] SIZES = {{1, 1}, {1, 67}, {67, 1}, {5, 3}, {33, 17}, {41, 150}};

    @FunctionalInterface
    interface Method {
        int call(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);
    }

    static final String[] NAMES = {"applySepia", "applySepiaPartial", "applyPosterize", "applyPosterizePartial",
            "applyCartoonize", "applyRetro", "applyVintage", "applyGothicNoir", "controlHue",
            "applyPointColorRed", "controlSaturation", "applyAutoAdjust"};
    static final Method[] METHODS = {
            (in, m, out, w, h, r) -> Engine.applySepia(in, out, w, h),
            Engine::applySepiaPartial,
            (in, m, out, w, h, r) -> Engine.applyPosterize(in, out, w, h),
            Engine::applyPosterizePartial,
            (in, m, out, w, h, r) -> Engine.applyCartoonize(in, out, w, h),
            (in, m, out, w, h, r) -> {
                Engine.applyRetro(in, out, w, h);
                return 0;
            },
            (in, m, out, w, h, r) -> {
                Engine.applyVintage(in, out, w, h);
                return 0;
            },
            (in, m, out, w, h, r) -> {
                Engine.applyGothicNoir(in, out, w, h);
                return 0;
            },
            (in, m, out, w, h, r) -> {
                Engine.controlHue(in, m, out, w, h, 7, r);
                return 0;
            },
            (in, m, out, w, h, r) -> {
                Engine.applyPointColorRed(in, out, w, h);
                return 0;
            },
            (in, m, out, w, h, r) -> {
                Engine.controlSaturation(in, m, out, w, h, 16, r);
                return 0;
            },
            (in, m, out, w, h, r) -> Engine.applyAutoAdjust(in, out, w, h)};

    @AfterEach
    void fastPathsBack() {
        TestHooks.setScalarOnly(false);
    }

    static byte[] mask(int n, long seed) {
        Random r = new Random(seed);
        byte[] m = new byte[n];
        for (int i = 0; i < n; i++) {
            m[i] = (byte) (r.nextInt(3) == 0 ? 0 : (r.nextInt(4) == 0 ? 2 : 1));
        }
        return m;
    }

    @Test
    void everyMethodGivesThePlainPathsResult() {
        for (int k = 0; k < METHODS.length; k++) {
            for (int[] size : SIZES) {
                final int w = size[0];
                final int h = size[1];
                final int n = w * h;
                for (Rect rect : new Rect[] {Rect.whole(), new Rect(w / 4, 0, w - 1, h / 2)}) {
                    int[] in = TestPictures.random(n, 100 + k * 7 + n);
                    byte[] m = mask(n, n);
                    int[] inCopy = in.clone();
                    int[] fast = TestPictures.random(n, 5);
                    int[] plain = fast.clone();
                    TestHooks.setScalarOnly(false);
                    int fastCode = METHODS[k].call(in, m, fast, w, h, rect);
                    TestHooks.setScalarOnly(true);
                    int plainCode = METHODS[k].call(in, m, plain, w, h, rect);
                    String what = NAMES[k] + " " + w + "x" + h + " rect " + rect.left + "," + rect.right;
                    assertEquals(plainCode, fastCode, what);
                    assertArrayEquals(plain, fast, what);
                    assertArrayEquals(inCopy, in, what + ": the input is only read");
                }
            }
        }
    }
}
