package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** The geometry methods through the bridge: sizes, packing, refusals, outputs of other sizes. */
class GeometryTest {
    static final int SENTINEL = 0x5A5A5A5A;

    static int[] random(int n, long seed) {
        Random r = new Random(seed);
        int[] p = new int[n];
        for (int i = 0; i < n; i++) {
            p[i] = r.nextInt();
        }
        return p;
    }

    /** 0xFF000000 | y << 8 | x. */
    static int[] positions(int w, int h) {
        int[] p = new int[w * h];
        for (int y = 0; y < h; y++) {
            for (int x = 0; x < w; x++) {
                p[y * w + x] = 0xFF000000 | y << 8 | x;
            }
        }
        return p;
    }

    static int pos(int x, int y) {
        return 0xFF000000 | y << 8 | x;
    }

    static int[] filled(int n, int v) {
        int[] p = new int[n];
        Arrays.fill(p, v);
        return p;
    }

    @Nested
    class Sizes {
        @Test
        void rotatedBoxSwapsSidesAtNinetyDegrees() {
            assertEquals(3, Engine.getRotateWidth(4, 3, 90));
            assertEquals(4, Engine.getRotateHeight(4, 3, 90));
            assertEquals(640, Engine.getRotateWidth(640, 480, 0));
            assertEquals(480, Engine.getRotateHeight(640, 480, 0));
        }

        @Test
        void mirrorSizesFollowAxisModeAndPosition() {
            assertEquals(2, Engine.getMirrorOutwidth(5, 0, Engine.MIRROR_KEEP_LEFT, Engine.MIRROR_AXIS_LEFT_RIGHT));
            assertEquals(6, Engine.getMirrorOutwidth(5, 2, Engine.MIRROR_KEEP_RIGHT, Engine.MIRROR_AXIS_LEFT_RIGHT));
            assertEquals(5, Engine.getMirrorOutwidth(5, 2, Engine.MIRROR_KEEP_LEFT, Engine.MIRROR_AXIS_UP_DOWN));
            assertEquals(5, Engine.getMirrorOutwidth(5, 5, Engine.MIRROR_KEEP_LEFT, Engine.MIRROR_AXIS_LEFT_RIGHT));
            assertEquals(8, Engine.getMirrorOutheight(6, 3, Engine.MIRROR_KEEP_TOP, Engine.MIRROR_AXIS_UP_DOWN));
            assertEquals(6, Engine.getMirrorOutheight(6, 3, Engine.MIRROR_KEEP_TOP, Engine.MIRROR_AXIS_LEFT_RIGHT));
        }
    }

    @Nested
    class RotateAndCrop {
        @Test
        void quarterTurnInPlace() {
            int[] px = {1, 2, 3, 4, 5, 6};
            assertEquals(Engine.SUCCESS, Engine.runRotateFlip(px, 3, 2, 1, false, false));
            assertArrayEquals(new int[] {4, 1, 5, 2, 6, 3}, px);
        }

        @Test
        void codeFourFlipsOnlyOrZeroesAndBadCodeIsRefused() {
            int[] px = {1, 2, 3, 4, 5, 6};
            assertEquals(Engine.SUCCESS, Engine.runRotateFlip(px, 3, 2, 4, true, false));
            assertArrayEquals(new int[] {3, 2, 1, 6, 5, 4}, px);
            assertEquals(Engine.ERR_NULL, Engine.runRotateFlip(px, 3, 2, 5, true, false));
            assertArrayEquals(new int[] {3, 2, 1, 6, 5, 4}, px);
            assertEquals(Engine.SUCCESS, Engine.runRotateFlip(px, 3, 2, 4, false, false));
            assertArrayEquals(new int[6], px);
        }

        @Test
        void nullOrShortPictureIsRefused() {
            assertEquals(Engine.ERR_NULL, Engine.runRotateFlip(null, 3, 2, 1, false, false));
            assertEquals(Engine.ERR_NULL, Engine.runRotateFlip(new int[5], 3, 2, 1, false, false));
            assertEquals(Engine.ERR_NULL, Engine.runRotateFlip(new int[6], 0, 2, 1, false, false));
            assertEquals(Engine.ERR_NULL, Engine.runCrop(null, 3, 2, new Rect(0, 0, 1, 1)));
            assertEquals(Engine.ERR_NULL, Engine.runCrop(new int[5], 3, 2, new Rect(0, 0, 1, 1)));
        }

        @Test
        void cropPacksRowsAtTheStartAndZeroesTheRest() {
            int[] px = positions(5, 4);
            assertEquals(Engine.SUCCESS, Engine.runCrop(px, 5, 4, new Rect(1, 1, 3, 2)));
            int[] want = new int[20];
            int[] packed = {pos(1, 1), pos(2, 1), pos(3, 1), pos(1, 2), pos(2, 2), pos(3, 2)};
            System.arraycopy(packed, 0, want, 0, packed.length);
            assertArrayEquals(want, px);
        }

        @Test
        void cropRectangleIsClippedOrRefused() {
            int[] px = positions(5, 4);
            assertEquals(Engine.SUCCESS, Engine.runCrop(px, 5, 4, new Rect(3, -2, 9, 0)));
            assertEquals(pos(3, 0), px[0]);
            assertEquals(pos(4, 0), px[1]);
            assertEquals(0, px[2]);
            int[] again = positions(5, 4);
            assertEquals(Engine.ERR_NULL, Engine.runCrop(again, 5, 4, new Rect(6, 0, 9, 3)));
            assertArrayEquals(positions(5, 4), again);
        }

        @Test
        void rotateNChecksEveryArrayAgainstItsOwnSize() {
            int[] src = positions(6, 4);
            byte[] sm = new byte[24];
            Arrays.fill(sm, (byte) 1);
            int ow = Engine.getRotateWidth(6, 4, 90);
            int oh = Engine.getRotateHeight(6, 4, 90);
            Rect all = new Rect(0, 0, 5, 3);
            assertEquals(Engine.ERR_NULL, Engine.runRotateN(src, sm, new int[ow * oh - 1], new byte[ow * oh], 6, 4,
                    ow, oh, 90, all, 6, 4));
            assertEquals(Engine.ERR_NULL, Engine.runRotateN(src, sm, new int[ow * oh], new byte[ow * oh - 1], 6, 4,
                    ow, oh, 90, all, 6, 4));
            assertEquals(Engine.ERR_NULL, Engine.runRotateN(src, null, new int[ow * oh], new byte[ow * oh], 6, 4,
                    ow, oh, 90, all, 6, 4));
            int[] dst = filled(ow * oh, SENTINEL);
            assertEquals(Engine.ERR_NULL, Engine.runRotateN(src, sm, dst, new byte[ow * oh], 6, 4, ow, oh, 90, all,
                    0, 4));
            assertEquals(Engine.ERR_NULL, Engine.runRotateN(src, sm, dst, new byte[ow * oh], 6, 4, ow, oh, 90,
                    new Rect(7, 0, 9, 3), 6, 4));
            assertArrayEquals(filled(ow * oh, SENTINEL), dst);
        }

        @Test
        void rotateNAtNinetyDegreesCopiesPixelsAndMask() {
            int[] src = positions(4, 2);
            byte[] sm = {1, 2, 3, 4, 5, 6, 7, 8};
            int[] dst = filled(8, SENTINEL);
            byte[] dm = new byte[8];
            assertEquals(Engine.SUCCESS, Engine.runRotateN(src, sm, dst, dm, 4, 2, 2, 4, 90, new Rect(0, 0, 3, 1),
                    4, 2));
            // out(i, j) = src(j - 2 + 2, -(i - 1) + 1) = src(j, 2 - i): column 1 reads row 1.
            for (int j = 0; j < 4; j++) {
                assertEquals(SENTINEL, dst[j * 2]);
                assertEquals(pos(j, 1), dst[j * 2 + 1]);
                assertEquals(sm[4 + j], dm[j * 2 + 1]);
            }
        }
    }

    @Nested
    class Straighten {
        @Test
        void angleZeroScaleOneCopies() {
            int[] in = random(35, 1);
            int[] out = new int[35];
            Engine.runStraighten(in, out, 7, 5, 0, 1.0f);
            assertArrayEquals(in, out);
        }

        @Test
        void canvasMethodsClearOutsideTheDrawnArea() {
            int[] in = filled(16, 0x80123456);
            int[] move = filled(64, SENTINEL);
            int[] up = filled(64, SENTINEL);
            Engine.runStraightenOnMove(in, 4, 4, move, 8, 8, 0, 1.0f);
            Engine.runStraightenOnUp(in, 4, 4, up, 8, 8, 0, 1.0f);
            for (int j = 0; j < 8; j++) {
                for (int i = 0; i < 8; i++) {
                    int want = i >= 2 && i < 6 && j >= 2 && j < 6 ? 0x80123456 : 0;
                    assertEquals(want, move[j * 8 + i]);
                    assertEquals(want, up[j * 8 + i]);
                }
            }
        }

        @Test
        void shortCanvasIsRefusedUntouched() {
            int[] in = filled(16, 1);
            int[] out = filled(63, SENTINEL);
            Engine.runStraightenOnMove(in, 4, 4, out, 8, 8, 5, 1.0f);
            Engine.runStraightenOnUp(in, 4, 4, out, 8, 8, 5, 1.0f);
            Engine.runStraighten(in, out, 8, 8, 5, 1.0f);
            assertArrayEquals(filled(63, SENTINEL), out);
        }
    }

    @Nested
    class Mirror {
        @Test
        void keepLeftAtZeroGivesTheFirstPixelTwice() {
            int[] in = {10, 11, 12, 13, 14};
            int[] out = new int[2];
            assertEquals(Engine.SUCCESS, Engine.runMirror(in, out, 5, 1, 0, Engine.MIRROR_KEEP_LEFT,
                    Engine.MIRROR_AXIS_LEFT_RIGHT));
            assertArrayEquals(new int[] {10, 10}, out);
        }

        @Test
        void keepBottomGrowsThePicture() {
            int[] in = positions(2, 3);
            int ow = Engine.getMirrorOutwidth(2, 0, Engine.MIRROR_KEEP_BOTTOM, Engine.MIRROR_AXIS_UP_DOWN);
            int oh = Engine.getMirrorOutheight(3, 0, Engine.MIRROR_KEEP_BOTTOM, Engine.MIRROR_AXIS_UP_DOWN);
            assertEquals(2, ow);
            assertEquals(6, oh);
            int[] out = new int[ow * oh];
            assertEquals(Engine.SUCCESS, Engine.runMirror(in, out, 2, 3, 0, Engine.MIRROR_KEEP_BOTTOM,
                    Engine.MIRROR_AXIS_UP_DOWN));
            int[] rows = {2, 1, 0, 0, 1, 2};
            for (int r = 0; r < 6; r++) {
                assertEquals(pos(0, rows[r]), out[r * 2]);
                assertEquals(pos(1, rows[r]), out[r * 2 + 1]);
            }
        }

        @Test
        void outputSmallerThanTheMirroredSizeIsRefused() {
            int[] in = random(20, 2);
            int[] out = filled(4 * 6 - 1, SENTINEL);
            // Keep top at row 2 of a 4 x 5 picture: 4 x 6 needed.
            assertEquals(Engine.ERR_NULL, Engine.runMirror(in, out, 4, 5, 2, Engine.MIRROR_KEEP_TOP,
                    Engine.MIRROR_AXIS_UP_DOWN));
            assertArrayEquals(filled(23, SENTINEL), out);
            assertEquals(Engine.ERR_NULL, Engine.runMirror(null, new int[24], 4, 5, 2, Engine.MIRROR_KEEP_TOP,
                    Engine.MIRROR_AXIS_UP_DOWN));
            assertEquals(Engine.ERR_NULL, Engine.runMirror(in, new int[24], 4, 5, 2, Engine.MIRROR_KEEP_LEFT,
                    Engine.MIRROR_AXIS_UP_DOWN));
        }
    }

    @Nested
    class Distortions {
        @Test
        void twirlAngleZeroCopies() {
            int[] in = random(99, 3);
            int[] out = new int[99];
            Engine.runTwirl(in, out, 11, 9, 5, 4, 4, 0, new Rect(0, 0, 10, 8), false);
            assertArrayEquals(in, out);
        }

        @Test
        void twirlKeepsAlphaAndOutsideOfCircle() {
            int[] in = random(21 * 21, 4);
            int[] out = new int[in.length];
            assertEquals(Engine.SUCCESS, Engine.runTwirl(in, out, 21, 21, 10, 10, 8, 270, new Rect(0, 0, 20, 20),
                    false));
            for (int y = 0; y < 21; y++) {
                for (int x = 0; x < 21; x++) {
                    int i = y * 21 + x;
                    assertEquals(in[i] >>> 24, out[i] >>> 24);
                    if ((x - 10) * (x - 10) + (y - 10) * (y - 10) >= 64) {
                        assertEquals(in[i], out[i]);
                    }
                }
            }
        }

        @Test
        void rectangleReachingOutsideIsClippedAndOneWhollyOutsideRefused() {
            int[] in = random(100, 5);
            int[] a = new int[100];
            int[] b = new int[100];
            assertEquals(Engine.SUCCESS, Engine.runTwirl(in, a, 10, 10, 5, 5, 4, 90, new Rect(-5, -5, 50, 50), true));
            assertEquals(Engine.SUCCESS, Engine.runTwirl(in, b, 10, 10, 5, 5, 4, 90, new Rect(-5, -5, 9, 9), true));
            assertArrayEquals(a, b);
            int[] out = filled(100, SENTINEL);
            assertEquals(Engine.ERR_NULL, Engine.runSphericity(in, out, 10, 10, 5, 5, 4, 50, new Rect(10, 0, 12, 9),
                    false));
            assertArrayEquals(filled(100, SENTINEL), out);
        }

        @Test
        void badCentreRadiusOrAmountIsRefusedUntouched() {
            int[] in = random(100, 6);
            int[] out = filled(100, SENTINEL);
            Rect all = new Rect(0, 0, 9, 9);
            assertEquals(Engine.ERR_NULL, Engine.runTwirl(in, out, 10, 10, 10, 5, 4, 90, all, false));
            assertEquals(Engine.ERR_NULL, Engine.runTwirl(in, out, 10, 10, 5, 5, 4, -361, all, false));
            assertEquals(Engine.ERR_NULL, Engine.runSphericity(in, out, 10, 10, 5, 5, 0, 50, all, false));
            assertEquals(Engine.ERR_NULL, Engine.runSphericity(in, out, 10, 10, 5, 5, 4, -101, all, false));
            assertEquals(Engine.ERR_NULL, Engine.runSphericity(in, new int[99], 10, 10, 5, 5, 4, 50, all, false));
            assertEquals(Engine.ERR_NULL, Engine.runTwirl(null, out, 10, 10, 5, 5, 4, 90, all, false));
            assertArrayEquals(filled(100, SENTINEL), out);
        }

        @Test
        void sphericityStrengthZeroCopies() {
            int[] in = random(100, 7);
            int[] out = new int[100];
            assertEquals(Engine.SUCCESS, Engine.runSphericity(in, out, 10, 10, 5, 5, 4, 0, new Rect(0, 0, 9, 9),
                    false));
            assertArrayEquals(in, out);
            // At half resolution the visited (even) pixels fill their 2 x 2 blocks.
            Engine.runSphericity(in, out, 10, 10, 5, 5, 4, 0, new Rect(0, 0, 9, 9), true);
            assertEquals(in[4 * 10 + 4], out[4 * 10 + 5]);
            assertEquals(in[4 * 10 + 4], out[5 * 10 + 5]);
            assertEquals(in[1], out[1]);  // outside the circle: the copy
        }
    }
}
