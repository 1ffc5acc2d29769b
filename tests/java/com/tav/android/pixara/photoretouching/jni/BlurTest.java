package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/** Blur, tilt-shift, miniature and out-focus through the bridge: checks, alpha, masks, kept state. */
class BlurTest {
    static final int W = 48;
    static final int H = 36;
    static final int N = W * H;

    static int[] picture(long seed, int n) {
        Random r = new Random(seed);
        int[] p = new int[n];
        for (int i = 0; i < n; i++) {
            p[i] = r.nextInt();
        }
        return p;
    }

    static int[] filled(int n, int value) {
        int[] p = new int[n];
        Arrays.fill(p, value);
        return p;
    }

    static byte[] ones(int n) {
        byte[] m = new byte[n];
        Arrays.fill(m, (byte) 1);
        return m;
    }

    static Rect all() {
        return new Rect(0, 0, W - 1, H - 1);
    }

    @AfterEach
    void release() {
        Engine.destroyBlur();
        Engine.destroyTiltShift();
    }

    @Test
    void initBlurChecksItsArrays() {
        int[] in = picture(1, N);
        assertEquals(Engine.ERR_NULL, Engine.initBlur(null, ones(N), W, H, all()));
        assertEquals(Engine.ERR_NULL, Engine.initBlur(in, new byte[N - 1], W, H, all()));
        assertEquals(Engine.ERR_NULL, Engine.initBlur(in, null, W, H, all()));
        assertEquals(Engine.ERR_NULL, Engine.initBlur(new int[N - 1], ones(N), W, H, all()));
        assertEquals(Engine.ERR_NULL, Engine.initBlur(in, ones(N), 0, H, all()));
        assertEquals(Engine.ERR_NULL, Engine.initBlur(in, ones(N), W, H, null));
        // An empty rectangle needs no mask.
        assertEquals(Engine.SUCCESS, Engine.initBlur(in, null, W, H, Rect.whole()));
    }

    @Test
    void applyBlurKeepsUnselectedPixelsAndAlpha() {
        int[] in = picture(2, N);
        byte[] mask = new byte[N];
        for (int i = 0; i < N; i++) {
            mask[i] = (byte) (i % W < W / 2 ? 1 : (i % 5 == 0 ? 2 : 0));  // only 1 selects
        }
        int[] out = new int[N];
        Engine.initBlur(in, mask, W, H, all());  // sets the session's whole-picture flag off
        Engine.destroyBlur();
        Engine.applyBlur(in, mask, out, W, H, 6, all());
        int changed = 0;
        for (int i = 0; i < N; i++) {
            assertEquals(in[i] >>> 24, out[i] >>> 24, "alpha at " + i);
            if (mask[i] != 1) {
                assertEquals(in[i], out[i], "unselected pixel " + i);
            } else if (in[i] != out[i]) {
                changed++;
            }
        }
        assertTrue(changed > N / 4, "selected pixels are blurred");
    }

    @Test
    void emptyRectangleBlursEverythingAndLeavesTheMaskAllZero() {
        int[] in = picture(3, N);
        byte[] mask = new byte[N];
        mask[5] = 1;
        mask[6] = 7;
        int[] whole = new int[N];
        Engine.applyBlur(in, mask, whole, W, H, 4, Rect.whole());
        assertArrayEquals(new byte[N], mask);
        int[] selected = new int[N];
        Engine.applyBlur(in, ones(N), selected, W, H, 4, all());
        assertArrayEquals(selected, whole);
        int[] nomask = new int[N];
        Engine.applyBlur(in, null, nomask, W, H, 4, Rect.whole());
        assertArrayEquals(whole, nomask);
    }

    @Test
    void refusedCallsWriteNothing() {
        int[] in = picture(4, N);
        int[] out = filled(N, 0x13);
        Engine.applyBlur(in, new byte[N - 1], out, W, H, 3, all());
        Engine.applyBlur(in, ones(N), new int[N - 1], W, H, 3, all());
        Engine.applyBlur(in, null, out, W, H, 3, all());
        Engine.applyTiltShift(in, new int[N - 1], W, H, H / 2, 4);
        Engine.applyTiltShift(null, out, W, H, H / 2, 4);
        Engine.applyMiniature(in, out, W, -H);
        Engine.initTiltShift(null, W, H);
        Engine.makeTiltShift(in, out, W, H, H / 2, 4);
        assertArrayEquals(filled(N, 0x13), out);
        assertEquals(Engine.ERR_NULL, Engine.applyOutfocusBlur(in, null, W, H, 2));
        assertEquals(Engine.ERR_NULL, Engine.applyOutfocusBlur(new int[3], out, W, H, 2));
        assertArrayEquals(filled(N, 0x13), out);
    }

    @Test
    void previewsNeedTheirSessionAndCheckTheirOwnSize() {
        int[] in = picture(5, N);
        int[] out = filled(N, 0x21);
        Engine.runBlurinPreview(in, ones(N), out, W, H, 5);
        Engine.makeTiltShift(in, out, W, H, H / 2, 3);
        assertArrayEquals(filled(N, 0x21), out, "no session: nothing written");

        assertEquals(Engine.SUCCESS, Engine.initBlur(in, ones(N), W, H, all()));
        // The preview is smaller than the picture: its arrays are checked against its own size.
        int pw = 20;
        int ph = 15;
        int[] small = picture(6, pw * ph);
        int[] smallOut = filled(pw * ph, 0x21);
        Engine.runBlurinPreview(small, ones(pw * ph), new int[pw * ph - 1], pw, ph, 5);
        Engine.runBlurinPreview(small, new byte[pw * ph - 1], smallOut, pw, ph, 5);
        Engine.runBlurinPreview(small, null, smallOut, pw, ph, 5);
        assertArrayEquals(filled(pw * ph, 0x21), smallOut);
        Engine.runBlurinPreview(small, ones(pw * ph), smallOut, pw, ph, 5);
        assertNotEquals(0x21, smallOut[0]);

        Engine.runBlurinPreview(in, ones(N), out, W, H, 5);
        int[] full = new int[N];
        Engine.applyBlur(in, ones(N), full, W, H, 5, all());
        assertArrayEquals(full, out, "preview at the session's size equals the full blur");

        // Tilt-shift initialisation releases the blur session.
        Engine.initTiltShift(in, W, H);
        int[] again = filled(N, 0x21);
        Engine.runBlurinPreview(in, ones(N), again, W, H, 5);
        assertArrayEquals(filled(N, 0x21), again);
        Engine.makeTiltShift(in, again, W, H, H / 2, 3);
        int[] applied = new int[N];
        Engine.applyTiltShift(in, applied, W, H, H / 2, 3);
        assertArrayEquals(applied, again);

        Engine.destroyTiltShift();
        Engine.destroyTiltShift();
        Engine.destroyBlur();
        Engine.destroyBlur();
        int[] after = filled(N, 0x21);
        Engine.makeTiltShift(in, after, W, H, H / 2, 3);
        assertArrayEquals(filled(N, 0x21), after);
    }

    @Test
    void tiltShiftBandStaysNearlySharp() {
        int w = 60;
        int h = 500;  // halved
        int[] in = picture(7, w * h);
        int[] out = new int[w * h];
        Engine.applyTiltShift(in, out, w, h, 250, 40);
        for (int y = 210; y <= 290; y++) {
            for (int x = 0; x < w; x++) {
                int i = y * w + x;
                assertEquals(in[i] >>> 24, out[i] >>> 24);
                for (int s = 0; s <= 16; s += 8) {
                    int d = ((in[i] >> s) & 255) - ((out[i] >> s) & 255);
                    assertTrue(d >= -1 && d <= 1, "row " + y);
                }
            }
        }
        assertNotEquals(in[0], out[0]);
        // A band that reaches the farther edge keeps every row sharp.
        Engine.applyTiltShift(in, out, w, h, 250, 250);
        assertArrayEquals(in, out);
    }

    @Test
    void miniatureAndOutfocusKeepAlpha() {
        int[] in = picture(8, N);
        int[] out = new int[N];
        Engine.applyMiniature(in, out, W, H);
        for (int i = 0; i < N; i++) {
            assertEquals(in[i] >>> 24, out[i] >>> 24);
        }
        assertEquals(Engine.SUCCESS, Engine.applyOutfocusBlur(in, out, W, H, 3));
        for (int i = 0; i < N; i++) {
            assertEquals(in[i] >>> 24, out[i] >>> 24);
        }
        int[] grey = filled(N, 0x40646464);
        assertEquals(Engine.SUCCESS, Engine.applyOutfocusBlur(grey, out, W, H, 7));
        assertArrayEquals(grey, out);
    }

    @Test
    void sessionsSurviveAnyOrderOfCalls() {
        Random r = new Random(9);
        int[][] sizes = {{W, H}, {500, 30}, {7, 3}, {1, 1}};
        for (int step = 0; step < 300; step++) {
            int[] s = sizes[r.nextInt(sizes.length)];
            int w = s[0];
            int h = s[1];
            int n = w * h;
            int[] in = picture(step, n);
            int[] out = new int[n];
            byte[] mask = new byte[n];
            for (int i = 0; i < n; i++) {
                mask[i] = (byte) r.nextInt(2);
            }
            Rect rect = r.nextBoolean() ? Rect.whole() : new Rect(0, 0, w - 1, h - 1);
            switch (r.nextInt(9)) {
                case 0 -> Engine.initBlur(in, mask, w, h, rect);
                case 1 -> Engine.runBlurinPreview(in, mask, out, w, h, r.nextInt(10) - 1);
                case 2 -> Engine.applyBlur(in, mask, out, w, h, r.nextInt(10) - 1, rect);
                case 3 -> Engine.destroyBlur();
                case 4 -> Engine.initTiltShift(in, w, h);
                case 5 -> Engine.makeTiltShift(in, out, w, h, r.nextInt(h + 20) - 10, r.nextInt(h + 5) - 2);
                case 6 -> Engine.applyTiltShift(in, out, w, h, r.nextInt(h), r.nextInt(h));
                case 7 -> Engine.destroyTiltShift();
                default -> Engine.applyMiniature(in, out, w, h);
            }
        }
        // Still working afterwards.
        int[] in = picture(10, N);
        int[] out = new int[N];
        assertEquals(Engine.SUCCESS, Engine.initBlur(in, ones(N), W, H, all()));
        Engine.runBlurinPreview(in, ones(N), out, W, H, 3);
        assertNotEquals(0, out[0]);
    }
}
