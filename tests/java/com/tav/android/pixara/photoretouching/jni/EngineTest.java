package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertNotEquals;

import java.util.Arrays;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The bridge as Java sees it: argument checks, alpha, masks, rectangles, saved state. */
class EngineTest {
    static final int W = 7;
    static final int H = 5;

    static int[] picture(long seed) {
        return TestPictures.random(W * H, seed);
    }

    static int[] filled(int value) {
        return TestPictures.filled(W * H, value);
    }

    @Nested
    class ToneMethods {
        @Test
        void brightnessOfSelectedPixelKeepsItsAlpha() {
            int[] in = filled(0x40808080);
            byte[] mask = new byte[W * H];
            mask[2 * W + 3] = 1;
            mask[2 * W + 4] = 2;  // only 1 selects
            int[] out = new int[W * H];
            Engine.controlBrightness(in, mask, out, W, H, 20, new Rect(0, 0, W - 1, H - 1));
            assertEquals(0x40E4E4E4, out[2 * W + 3]);
            assertEquals(0x40808080, out[2 * W + 4]);
            assertEquals(0x40808080, out[0]);
        }

        @Test
        void emptyRectangleMeansWholePictureAndMaskIsNotRead() {
            int[] in = picture(1);
            int[] out = new int[W * H];
            Engine.controlSaturation(in, null, out, W, H, 0, Rect.whole());
            for (int i = 0; i < in.length; i++) {
                int r = (in[i] >> 16) & 255;
                int g = (in[i] >> 8) & 255;
                int b = in[i] & 255;
                int y = (316 * r + 624 * g + 84 * b) >> 10;
                assertEquals((in[i] & 0xFF000000) | y << 16 | y << 8 | y, out[i]);
            }
        }

        @Test
        void rectangleIsClippedToThePicture() {
            int[] in = filled(0xFF646464);
            byte[] mask = new byte[W * H];
            Arrays.fill(mask, (byte) 1);
            int[] out = new int[W * H];
            Engine.controlExposure(in, mask, out, W, H, 20, new Rect(-10, 3, 100, 100));
            for (int y = 0; y < H; y++) {
                for (int x = 0; x < W; x++) {
                    assertEquals(y >= 3 ? 0xFFC8C8C8 : 0xFF646464, out[y * W + x], "at " + x + "," + y);
                }
            }
        }

        @Test
        void everyToneMethodChangesOnlyTheSelection() {
            int[] in = picture(2);
            byte[] mask = new byte[W * H];
            mask[W + 1] = 1;
            Rect rect = new Rect(1, 1, 1, 1);
            int[][] outs = new int[11][W * H];
            Engine.controlBrightness(in, mask, outs[0], W, H, 15, rect);
            Engine.controlBrightnessRange100(in, mask, outs[1], W, H, 80, rect);
            Engine.controlContrast(in, mask, outs[2], W, H, 18, rect);
            Engine.controlContrastRange100(in, mask, outs[3], W, H, 90, rect);
            Engine.controlSaturation(in, mask, outs[4], W, H, 2, rect);
            Engine.controlSaturationRange100(in, mask, outs[5], W, H, 5, rect);
            Engine.controlTemperature(in, mask, outs[6], W, H, 1, rect);
            Engine.controlTemperatureRange100(in, mask, outs[7], W, H, 95, rect);
            Engine.controlExposure(in, mask, outs[8], W, H, 19, rect);
            Engine.controlFadedColour(in, mask, outs[9], W, H, 100, rect);
            Engine.controlGreyscale(in, mask, outs[10], W, H, 13, rect);
            for (int k = 0; k < outs.length; k++) {
                for (int i = 0; i < in.length; i++) {
                    if (i != W + 1) {
                        assertEquals(in[i], outs[k][i], "method " + k + " pixel " + i);
                    }
                }
                assertNotEquals(in[W + 1], outs[k][W + 1], "method " + k + " changed nothing");
                assertEquals(in[W + 1] & 0xFF000000, outs[k][W + 1] & 0xFF000000, "alpha of method " + k);
            }
        }

        @Test
        void sameArrayAsInputAndOutput() {
            int[] pic = filled(0x10203040);
            int[] expected = new int[W * H];
            Engine.controlGreyscale(pic.clone(), null, expected, W, H, 10, Rect.whole());
            Engine.controlGreyscale(pic, null, pic, W, H, 10, Rect.whole());
            assertArrayEquals(expected, pic);
        }
    }

    @Nested
    class BadInput {
        final int[] in = picture(3);
        final byte[] mask = new byte[W * H];
        final Rect rect = new Rect(0, 0, 2, 2);

        void assertUntouched(int[] out) {
            assertArrayEquals(filled(0x11111111), out);
        }

        @Test
        void voidMethodsDoNothing() {
            int[] out = filled(0x11111111);
            Engine.controlContrast(null, mask, out, W, H, 15, rect);
            Engine.controlContrast(in, mask, null, W, H, 15, rect);
            Engine.controlContrast(in, null, out, W, H, 15, rect);  // mask needed for a rectangle
            Engine.controlContrast(in, new byte[3], out, W, H, 15, rect);
            Engine.controlContrast(new int[W * H - 1], mask, out, W, H, 15, rect);
            Engine.controlContrast(in, mask, out, -W, H, 15, rect);
            Engine.controlContrast(in, mask, out, 0, H, 15, rect);
            Engine.controlContrast(in, mask, out, 65536, 65536, 15, rect);
            Engine.controlContrast(in, mask, out, W, H, 15, null);
            Engine.controlContrast(in, mask, out, W, H, 15, new Rect(W, 0, W + 5, 3));  // wholly outside
            assertUntouched(out);
        }

        @Test
        void statusMethodsReturnNullCode() {
            int[] out = filled(0x11111111);
            assertEquals(Engine.ERR_NULL, Engine.applySepia(null, out, W, H));
            assertEquals(Engine.ERR_NULL, Engine.applySepia(in, null, W, H));
            assertEquals(Engine.ERR_NULL, Engine.applySepia(in, new int[4], W, H));
            assertEquals(Engine.ERR_NULL, Engine.applySepia(in, out, W, -1));
            assertEquals(Engine.ERR_NULL, Engine.applySepia(in, out, Integer.MAX_VALUE, 2));
            assertEquals(Engine.ERR_NULL, Engine.applySepiaPartial(in, null, out, W, H, rect));
            assertEquals(Engine.ERR_NULL, Engine.applySepiaPartial(in, mask, out, W, H, null));
            assertEquals(Engine.ERR_NULL, Engine.storeMask(null, W, H, rect));
            assertEquals(Engine.ERR_NULL, Engine.storeObject(new int[2], W, H, rect));
            assertUntouched(out);
        }
    }

    @Nested
    class Effects {
        @Test
        void sepiaTakesAlphaFromTheInput() {
            int[] in = filled(0x12000000);
            int[] out = filled(0x7F7F7F7F);
            assertEquals(Engine.SUCCESS, Engine.applySepia(in, out, W, H));
            // Black raised to level 15: (31, 12, 0).
            assertArrayEquals(filled(0x121F0C00), out);
        }

        @Test
        void partialSepiaMergesByMask() {
            int[] in = picture(4);
            int[] whole = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applySepia(in, whole, W, H));
            byte[] mask = new byte[W * H];
            for (int i = 0; i < mask.length; i += 3) {
                mask[i] = 1;
            }
            mask[1] = 2;
            int[] out = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applySepiaPartial(in, mask, out, W, H, new Rect(0, 0, 0, 0)));
            for (int i = 0; i < in.length; i++) {
                assertEquals(mask[i] == 1 ? whole[i] : in[i], out[i], "pixel " + i);
            }
            int[] all = new int[W * H];
            assertEquals(Engine.SUCCESS, Engine.applySepiaPartial(in, mask, all, W, H, new Rect(5, 0, 4, 0)));
            assertArrayEquals(whole, all);
        }

        @Test
        void version() {
            assertEquals("KALO_FXL_PE_ENG_QT13_REL_5.1__Nov 15 201315:50:20", Engine.LibVersion());
        }
    }

    @Nested
    class SavedRegions {
        @Test
        void maskIsSavedAndRecovered() {
            byte[] mask = new byte[W * H];
            for (int i = 0; i < mask.length; i++) {
                mask[i] = (byte) i;
            }
            assertEquals(0, Engine.storeMask(mask, W, H, new Rect(2, 1, 4, 3)));
            byte[] target = new byte[W * H];
            assertEquals(0, Engine.recoverMask(target, W, H, new Rect(2, 1, 4, 3)));
            for (int y = 0; y < H; y++) {
                for (int x = 0; x < W; x++) {
                    boolean inside = x >= 2 && x <= 4 && y >= 1 && y <= 3;
                    assertEquals(inside ? mask[y * W + x] : 0, target[y * W + x]);
                }
            }
            // A recover keeps the saved copy; a delete frees it.
            assertEquals(0, Engine.recoverMask(new byte[W * H], W, H, new Rect(0, 0, 2, 2)));
            Engine.deleteStoredMask();
            assertEquals(-1, Engine.recoverMask(target, W, H, new Rect(2, 1, 4, 3)));
            Engine.deleteStoredMask();
        }

        @Test
        void onePixelMask() {
            byte[] mask = new byte[W * H];
            mask[3 * W + 6] = 9;
            assertEquals(0, Engine.storeMask(mask, W, H, new Rect(6, 3, 6, 3)));
            byte[] target = new byte[W * H];
            assertEquals(0, Engine.recoverMask(target, W, H, new Rect(0, 0, 0, 0)));
            assertEquals(9, target[0]);
            assertEquals(1, java.util.stream.IntStream.range(0, target.length).filter(i -> target[i] != 0).count());
            Engine.deleteStoredMask();
        }

        @Test
        void objectIsSavedAndRecovered() {
            int[] pic = picture(5);
            assertEquals(0, Engine.storeObject(pic, W, H, new Rect(0, 0, W - 1, H - 1)));
            int[] target = new int[W * H];
            assertEquals(0, Engine.recoverObject(target, W, H, new Rect(0, 0, W - 1, H - 1)));
            assertArrayEquals(pic, target);
            Engine.deleteStoredObject();
            assertEquals(-1, Engine.recoverObject(target, W, H, new Rect(0, 0, 1, 1)));
        }
    }
}
