package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The colour tools through the bridge: results, alpha, masks, bad arrays and kept state. */
class ColourTest {
    static final int W = 9;
    static final int H = 6;

    static int[] picture(long seed) {
        Random r = new Random(seed);
        int[] p = new int[W * H];
        for (int i = 0; i < p.length; i++) {
            p[i] = r.nextInt();
        }
        return p;
    }

    static int[] filled(int value) {
        int[] p = new int[W * H];
        Arrays.fill(p, value);
        return p;
    }

    @Nested
    class HueAndBalance {
        @Test
        void hueHalfTurnOnSelectedRedKeepsAlpha() {
            int[] in = filled(0x21FF0000);
            byte[] mask = new byte[W * H];
            mask[W + 2] = 1;
            mask[W + 3] = 2;  // only 1 selects
            int[] out = new int[W * H];
            Engine.controlHue(in, mask, out, W, H, 10, new Rect(0, 0, W - 1, H - 1));
            assertEquals(0x2100FFFF, out[W + 2]);
            assertEquals(0x21FF0000, out[W + 3]);
            assertEquals(0x21FF0000, out[0]);
            int[] whole = new int[W * H];
            Engine.controlHueRange100(in, null, whole, W, H, 0, Rect.whole());
            assertArrayEquals(filled(0x2100FFFF), whole);
        }

        @Test
        void balanceOnWholePicture() {
            int[] in = filled(0x80646464);
            int[] out = new int[W * H];
            Engine.adjustRGB(in, null, out, W, H, 20, 10, 10, Rect.whole());
            assertArrayEquals(filled(0x80A04646), out);
            Engine.adjustRGBRange100(in, null, out, W, H, 50, 50, 0, Rect.whole());
            assertArrayEquals(filled(0x80828228), out);
        }

        @Test
        void refusedArgumentsLeaveTheOutputUntouched() {
            int[] in = picture(3);
            int[] out = filled(7);
            byte[] mask = new byte[W * H];
            Rect rect = new Rect(1, 1, 3, 3);
            Engine.controlHue(null, mask, out, W, H, 5, rect);
            Engine.controlHue(in, mask, new int[W], W, H, 5, rect);
            Engine.adjustRGB(in, null, out, W, H, 20, 10, 10, rect);  // a rectangle needs the mask
            Engine.adjustRGB(in, new byte[3], out, W, H, 20, 10, 10, rect);
            Engine.adjustRGBRange100(in, mask, out, 0, H, 20, 10, 10, rect);
            Engine.controlHueRange100(in, mask, out, W, H, 20, null);
            assertArrayEquals(filled(7), out);
        }

        @Test
        void pointColourKeepsOneFamily() {
            int[] in = filled(0x5500FF00);
            in[0] = 0x55FF0000;
            int[] out = new int[W * H];
            Engine.applyPointColorRed(in, out, W, H);
            assertEquals(0x55FE0000, out[0]);
            assertEquals(0x55959595, out[1]);
            Engine.applyPointColorGreen(in, out, W, H);
            assertEquals(0x5500FF00, out[1]);
            assertNotEquals(0x55FE0000, out[0]);
            int[] untouched = filled(3);
            Engine.applyPointColorBlue(in, new int[2], W, H);
            Engine.applyPointColorYellow(null, untouched, W, H);
            assertArrayEquals(filled(3), untouched);
        }
    }

    @Nested
    class AutoAdjust {
        @Test
        void settingsAreKeptBetweenCallsAndCheckedOneByOne() {
            assertEquals(70, Engine.getAutoAdjustThreshold());
            assertEquals(100, Engine.getAutoAdjustCutoff());
            assertEquals(1000, Engine.getAutoAdjustWeight1());
            assertEquals(5120, Engine.getAutoAdjustWeight2());
            try {
                Engine.setAutoAdjust(128, 50, -1, 300);
                assertEquals(70, Engine.getAutoAdjustThreshold());
                assertEquals(50, Engine.getAutoAdjustCutoff());
                assertEquals(1000, Engine.getAutoAdjustWeight1());
                assertEquals(300, Engine.getAutoAdjustWeight2());
                // A lower curve gives a darker result than the default.
                // Mid-grey 10 x 10: the default curve takes 128 to 239.
                int[] in = new int[100];
                Arrays.fill(in, 0xFF808080);
                int[] out = new int[100];
                assertEquals(Engine.SUCCESS, Engine.applyAutoAdjust(in, out, 10, 10));
                int low = out[0] & 255;
                Engine.setAutoAdjust(70, 100, 1000, 5120);
                assertEquals(Engine.SUCCESS, Engine.applyAutoAdjust(in, out, 10, 10));
                assertEquals(0xFF, out[0] >>> 24);
                assertEquals(239, out[0] & 255);
                assertEquals(true, low < 239, "cutoff 50 gave " + low);
            } finally {
                Engine.setAutoAdjust(70, 100, 1000, 5120);
            }
        }

        @Test
        void badArraysAreRefused() {
            int[] in = picture(5);
            int[] out = filled(1);
            assertEquals(Engine.ERR_NULL, Engine.applyAutoAdjust(null, out, W, H));
            assertEquals(Engine.ERR_NULL, Engine.applyAutoAdjust(in, null, W, H));
            assertEquals(Engine.ERR_NULL, Engine.applyAutoAdjust(in, new int[W * H - 1], W, H));
            assertEquals(Engine.ERR_NULL, Engine.applyAutoAdjust(in, out, W, -1));
            assertArrayEquals(filled(1), out);
            int[] alpha = picture(6);
            assertEquals(Engine.SUCCESS, Engine.applyAutoAdjust(alpha, out, W, H));
            for (int i = 0; i < out.length; i++) {
                assertEquals(alpha[i] >>> 24, out[i] >>> 24);
            }
        }
    }
}
