package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;

import java.util.Arrays;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The colour tools through the bridge: results, alpha, masks, bad arrays and kept state. */
class ColourTest {
    static final int W = 9;
    static final int H = 6;

    static int[] picture(long seed) {
        return TestPictures.random(W * H, seed);
    }

    static int[] filled(int value) {
        return TestPictures.filled(W * H, value);
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

    @Nested
    class BrushesAndSplash {
        @Test
        void splashSessionIsKeptBetweenCalls() {
            Engine.finishSplash();
            int[] colour = picture(8);
            int[] img = colour.clone();
            assertEquals(Engine.SUCCESS, Engine.drawSplash(img, 4, 3, 3, W, H));  // no session yet
            assertEquals(Engine.SUCCESS, Engine.recoverSplash(img, W, H));
            assertArrayEquals(colour, img);
            try {
                assertEquals(Engine.SUCCESS, Engine.initSplash(img, W, H));
                int[] grey = new int[W * H];
                assertEquals(Engine.SUCCESS, Engine.setGrayInSplash(colour, grey, W, H));
                assertArrayEquals(grey, img);
                assertEquals(Engine.SUCCESS, Engine.drawSplash(img, 4, 3, 2, W, H));
                assertEquals(colour[3 * W + 4], img[3 * W + 4]);
                assertEquals(grey[0], img[0]);
                int[] preview = new int[(W / 2) * (H / 2)];
                assertEquals(Engine.SUCCESS, Engine.drawSplashPreview(img, preview, 0, 0, 2, W, H, W / 2, H / 2));
                assertEquals(colour[0], img[0]);
                assertEquals(colour[0], preview[0]);
                assertEquals(Engine.SUCCESS, Engine.recoverSplash(img, W, H));
                assertArrayEquals(colour, img);
                // A second start replaces the kept picture.
                assertEquals(Engine.SUCCESS, Engine.initSplash(grey.clone(), W, H));
                assertEquals(Engine.SUCCESS, Engine.recoverSplash(img, W, H));
                assertArrayEquals(grey, img);
            } finally {
                Engine.finishSplash();
            }
            int[] after = picture(9);
            assertEquals(Engine.SUCCESS, Engine.recoverSplash(after, W, H));
            assertArrayEquals(picture(9), after);
        }

        @Test
        void brushesRefuseBadArrays() {
            int[] img = filled(0xFF646464);
            int[] preview = new int[4];
            assertEquals(Engine.ERR_NULL, Engine.rubLighten(null, 3, 3, 2, 50, W, H));
            assertEquals(Engine.ERR_NULL, Engine.rubDarken(new int[W * H - 1], 3, 3, 2, 50, W, H));
            assertEquals(Engine.ERR_NULL, Engine.rubLightenPreview(img, null, 3, 3, 2, 50, W, H, 2, 2));
            assertEquals(Engine.ERR_NULL, Engine.rubDarkenPreview(img, preview, 3, 3, 2, 50, W, H, 3, 2));
            assertEquals(Engine.ERR_NULL, Engine.rubDarkenPreview(img, preview, 3, 3, 2, 50, W, H, 0, 2));
            assertEquals(Engine.ERR_NULL, Engine.initSplash(img, W, 0));
            assertEquals(Engine.ERR_NULL, Engine.drawSplashPreview(img, null, 3, 3, 2, W, H, 2, 2));
            assertEquals(Engine.ERR_NULL, Engine.setGrayInSplash(img, new int[1], W, H));
            Engine.rubPixelize(new int[5], 3, 3, 8, 1, W, H);
            Engine.rubPixelizePreview(img, new int[1], 3, 3, 8, 1, W, H, 2, 2);
            assertArrayEquals(filled(0xFF646464), img);
        }

        @Test
        void brushesChangeTheImageInPlace() {
            int[] img = filled(0x33646464);
            assertEquals(Engine.SUCCESS, Engine.rubLighten(img, 4, 3, 2, 50, W, H));
            assertEquals(0x33969696, img[3 * W + 4]);
            assertEquals(0x33646464, img[3 * W + 6]);
            assertEquals(Engine.SUCCESS, Engine.rubDarken(img, 4, 3, 2, 50, W, H));
            assertEquals(0x33646464, img[3 * W + 4]);
            int[] preview = new int[4 * 3];
            assertEquals(Engine.SUCCESS, Engine.rubDarkenPreview(img, preview, 4, 3, 2, 100, W, H, 4, 3));
            assertEquals(0x33000000, img[3 * W + 4]);
            assertEquals(img[0], preview[0]);
            int[] pix = picture(12);
            int[] before = pix.clone();
            Engine.rubPixelize(pix, 1, 1, 1, 1, W, H);
            assertEquals(before[0], pix[W + 1]);
            int[] out = new int[W * H];
            Engine.applyPixelize(before, out, W, H, 1);
            assertEquals(before[2 * W + 2], out[3 * W + 3]);
        }

        @Test
        void invertAndLenses() {
            int[] in = filled(0x11203040);
            int[] out = new int[W * H];
            Engine.applyInvert(in, null, out, W, H, Rect.whole());  // the mask is required
            assertArrayEquals(new int[W * H], out);
            byte[] mask = new byte[W * H];
            mask[5] = 1;
            Engine.applyInvert(in, mask, out, W, H, new Rect(0, 0, W - 1, 0));
            assertEquals(0x11DFCFBF, out[5]);
            assertEquals(0x11203040, out[4]);
            int[] white = filled(0xFFFFFFFF);
            Engine.controlTopLens(white, out, W, H, 0, 50);  // rows 0..2
            assertEquals(0xFFFF0000, out[0]);
            assertEquals(0xFFFFFFFF, out[3 * W]);
            int[] keep = filled(4);
            Engine.controlEdgeLens(white, keep, W, H, 0, 101);  // size above 100: nothing written
            Engine.controlEdgeLens(null, keep, W, H, 0, 10);
            assertArrayEquals(filled(4), keep);
            Engine.controlEdgeLens(white, keep, W, H, 0, 0);
            assertArrayEquals(white, keep);
        }
    }
}
