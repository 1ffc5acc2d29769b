package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.Arrays;
import java.util.Random;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/** The selection tools through the bridge: the lasso session, tap-to-select, grow, shrink and fill holes. */
class SelectionTest {
    private static final int W = 53;
    private static final int H = 41;

    @AfterEach
    void end() {
        Engine.selectionFinish();
    }

    /** An orange rectangle 12..37 x 9..30 on blue, with seeded noise of +-2. */
    private static int[] scene(byte[] truth) {
        Random rng = new Random(5);
        int[] p = new int[W * H];
        for (int y = 0; y < H; y++) {
            for (int x = 0; x < W; x++) {
                boolean in = x >= 12 && x <= 37 && y >= 9 && y <= 30;
                int n = rng.nextInt(5) - 2;
                p[y * W + x] = in ? 0xFF000000 | (210 + n) << 16 | (140 + n) << 8 | (40 + n)
                        : 0xFF000000 | (30 + n) << 16 | (50 + n) << 8 | (120 + n);
                if (truth != null) {
                    truth[y * W + x] = (byte) (in ? 1 : 0);
                }
            }
        }
        return p;
    }

    private static int[] outline() {
        int[] xy = new int[Engine.selectionOutlineLength() * 2];
        assertEquals(Engine.SUCCESS, Engine.selectionGetOutline(xy));
        return xy;
    }

    @Test
    void lassoAroundARectangleSelectsItAndReportsItsBounds() {
        byte[] truth = new byte[W * H];
        int[] pic = scene(truth);
        int[] copy = pic.clone();
        assertEquals(Engine.SUCCESS, Engine.selectionStart(pic, W, H));
        // Taps up to 2 pixels off the corners (corner 38, 31 is the bottom right one).
        assertEquals(0, Engine.selectionAddPoint(13, 8));
        int total = 1;
        for (int[] t : new int[][] {{39, 10}, {37, 32}, {11, 30}}) {
            int steps = Engine.selectionAddPoint(t[0], t[1]);
            assertTrue(steps > 0 && steps < Engine.SUCCESS, "segment length " + steps);
            total += steps;
        }
        assertEquals(4, Engine.selectionPointCount());
        assertEquals(total, Engine.selectionOutlineLength());
        byte[] mask = new byte[W * H];
        Arrays.fill(mask, (byte) 7);
        Rect r = new Rect();
        assertEquals(Engine.SUCCESS, Engine.selectionClose(mask, W, H, r));
        assertArrayEquals(truth, mask);
        assertEquals(12, r.left);
        assertEquals(37, r.right);
        assertEquals(9, r.top);
        assertEquals(30, r.bottom);
        assertArrayEquals(copy, pic, "the picture is only read");
        // The mask works with the existing region tools: closing notches keeps it.
        assertEquals(Engine.SUCCESS, Engine.setObjectRegion(mask, W, H, r, 2));
        assertArrayEquals(truth, mask);
    }

    @Test
    void removingAPointRestoresTheOutlineAndMissingPointsGive40968() {
        int[] pic = scene(null);
        assertEquals(Engine.SUCCESS, Engine.selectionStart(pic, W, H));
        assertEquals(Engine.ERR_NO_POINT, Engine.selectionRemovePoint(10, 10));
        assertEquals(Engine.ERR_NO_POINT, Engine.selectionMovePoint(10, 10, 12, 12));
        Engine.selectionAddPoint(13, 8);
        Engine.selectionAddPoint(39, 10);
        int[] two = outline();
        // A point in the flat background, far from every edge, then taken away.
        Engine.selectionAddPoint(47, 37);
        assertTrue(outline().length > two.length);
        assertEquals(Engine.ERR_NO_POINT, Engine.selectionRemovePoint(47, 20));
        assertEquals(Engine.SUCCESS, Engine.selectionRemovePoint(45, 36));
        assertArrayEquals(two, outline());
        assertEquals(Engine.ERR_NULL, Engine.selectionRemovePoint(W, 3));
        assertEquals(Engine.ERR_NULL, Engine.selectionAddPoint(-1, 3));
        assertEquals(Engine.ERR_NULL, Engine.selectionMovePoint(13, 8, 3, H));
        assertArrayEquals(two, outline());
        // A short outline array and closing with 2 points are refused, the mask untouched.
        assertEquals(Engine.ERR_NULL, Engine.selectionGetOutline(new int[two.length - 1]));
        assertEquals(Engine.ERR_NULL, Engine.selectionGetOutline(null));
        byte[] mask = new byte[W * H];
        Arrays.fill(mask, (byte) 3);
        byte[] before = mask.clone();
        assertEquals(Engine.ERR_NULL, Engine.selectionClose(mask, W, H, new Rect()));
        Engine.selectionAddPoint(37, 32);
        assertEquals(Engine.ERR_NULL, Engine.selectionClose(mask, W + 1, H, new Rect()), "another size");
        assertEquals(Engine.ERR_NULL, Engine.selectionClose(new byte[W * H - 1], W, H, new Rect()));
        assertEquals(Engine.ERR_NULL, Engine.selectionClose(null, W, H, new Rect()));
        assertArrayEquals(before, mask);
        assertEquals(Engine.SUCCESS, Engine.selectionClose(mask, W, H, null), "bounds are optional");
        // After finishing, every call is refused and nothing is left.
        assertEquals(Engine.SUCCESS, Engine.selectionFinish());
        assertEquals(0, Engine.selectionPointCount());
        assertEquals(0, Engine.selectionOutlineLength());
        assertEquals(Engine.ERR_NULL, Engine.selectionAddPoint(5, 5));
        assertEquals(Engine.ERR_NULL, Engine.selectionRemovePoint(13, 8));
        assertEquals(Engine.ERR_NULL, Engine.selectionGetOutline(new int[8]));
        assertEquals(Engine.ERR_NULL, Engine.selectionClose(mask, W, H, new Rect()));
        assertEquals(Engine.ERR_NULL, Engine.selectionStart(pic, W, 0));
        assertEquals(Engine.ERR_NULL, Engine.selectionStart(new int[W * H - 1], W, H));
    }

    @Test
    void tapSelectsTheRegionAndCombinesWithTheMask() {
        byte[] truth = new byte[W * H];
        int[] pic = scene(truth);
        byte[] mask = new byte[W * H];
        Rect r = new Rect();
        assertEquals(Engine.SUCCESS, Engine.selectTap(pic, mask, W, H, 20, 20, 50, Engine.SELECT_REPLACE, r));
        assertArrayEquals(truth, mask);
        assertEquals(12, r.left);
        assertEquals(30, r.bottom);
        // Adding the background selects everything; subtracting the object leaves the background.
        assertEquals(Engine.SUCCESS, Engine.selectTap(pic, mask, W, H, 0, 0, 50, Engine.SELECT_ADD, r));
        for (byte b : mask) {
            assertEquals(1, b);
        }
        assertEquals(Engine.SUCCESS, Engine.selectTap(pic, mask, W, H, 30, 12, 50, Engine.SELECT_SUBTRACT, r));
        for (int i = 0; i < mask.length; i++) {
            assertEquals(1 - truth[i], mask[i]);
        }
        assertEquals(0, r.left);
        assertEquals(W - 1, r.right);
        byte[] keep = mask.clone();
        assertEquals(Engine.ERR_NULL, Engine.selectTap(pic, mask, W, H, W, 0, 50, Engine.SELECT_ADD, r));
        assertEquals(Engine.ERR_NULL, Engine.selectTap(pic, mask, W, H, 0, 0, 50, 3, r));
        assertEquals(Engine.ERR_NULL, Engine.selectTap(pic, new byte[5], W, H, 0, 0, 50, 0, r));
        assertEquals(Engine.ERR_NULL, Engine.selectTap(null, mask, W, H, 0, 0, 50, 0, r));
        assertArrayEquals(keep, mask);
    }

    @Test
    void growShrinkAndFillHoles() {
        byte[] truth = new byte[W * H];
        scene(truth);
        byte[] mask = truth.clone();
        Rect r = new Rect();
        assertEquals(Engine.SUCCESS, Engine.selectGrow(mask, W, H, 3, r));
        assertEquals(9, r.left);
        assertEquals(40, r.right);
        assertEquals(6, r.top);
        assertEquals(33, r.bottom);
        assertEquals(Engine.SUCCESS, Engine.selectGrow(mask, W, H, -3, r));
        assertArrayEquals(truth, mask, "a rectangle grown and shrunk by the same amount is itself");
        // A hole in the middle is filled.
        mask[20 * W + 20] = 0;
        mask[20 * W + 21] = 0;
        assertEquals(Engine.SUCCESS, Engine.selectFillHoles(mask, W, H, r));
        assertArrayEquals(truth, mask);
        assertEquals(Engine.ERR_NULL, Engine.selectGrow(new byte[3], W, H, 1, r));
        assertEquals(Engine.ERR_NULL, Engine.selectFillHoles(mask, 0, H, r));
    }
}
