package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.io.IOException;
import java.util.Arrays;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/**
 * Every allocation of a call made to fail in turn (the first, then the
 * second, ... until the call makes no more): the call reports its allocation
 * result, frees every block it took and leaves its output as it was; the
 * sessions keep no state.
 */
class AllocationFailureTest {
    private static final int W = 37;
    private static final int H = 29;
    private static final int N = W * H;
    private static final int SKIP = Integer.MIN_VALUE;  // a void method: no code to check

    @AfterEach
    void cleanUp() {
        TestHooks.failNthAllocation(0);
        Engine.finishPortrait();
        Engine.destroyBlur();
        Engine.destroyTiltShift();
        Engine.DeInitBLC();
        Engine.deleteStoredMask();
        Engine.deleteStoredObject();
        Engine.setEraserStatus(Engine.ERASER_IDLE);
    }

    interface Call {
        int run();
    }

    static Call of(Runnable r) {
        return () -> {
            r.run();
            return SKIP;
        };
    }

    /**
     * Fails each allocation of {@code call} in turn. {@code watched} are the
     * arrays the call writes, which must stay as they were on a failure;
     * {@code failures} the result codes a failure may give (SUCCESS where the
     * call has a fallback that needs no memory, and then may write its
     * output). Returns how many allocations the call makes.
     */
    static int eachAllocationFails(String name, Call call, int[][] watched, int... failures) {
        int[][] before = new int[watched.length][];
        for (int i = 0; i < watched.length; i++) {
            before[i] = watched[i].clone();
        }
        for (int n = 1; n < 100000; n++) {
            long live = TestHooks.liveBlocks();
            TestHooks.failNthAllocation(n);
            int rc = call.run();
            boolean failed = !TestHooks.failurePending();
            TestHooks.failNthAllocation(0);
            if (!failed) {
                assertTrue(n > 1, name + " allocates nothing");
                return n - 1;
            }
            String what = name + ", allocation " + n + " failing";
            if (rc != SKIP) {
                final int got = rc;
                assertTrue(Arrays.stream(failures).anyMatch(f -> f == got), what + " gave " + rc);
            }
            assertEquals(live, TestHooks.liveBlocks(), what + ": blocks not freed");
            for (int i = 0; i < watched.length && rc != Engine.SUCCESS; i++) {
                assertArrayEquals(before[i], watched[i], what + ": output " + i + " written");
            }
        }
        throw new AssertionError(name + " never stops allocating");
    }

    @Test
    void effectLibraryFamiliesReportAllocationOrEffectFailure() {
        int[] in = TestPictures.random(N, 1);
        int[] texture = TestPictures.random(N, 2);
        byte[] mask = new byte[N];
        Arrays.fill(mask, (byte) 1);
        Rect rect = new Rect(3, 4, 30, 20);
        int[] out = new int[N];
        int a = Engine.ERR_ALLOC;
        int e = Engine.ERR_EFFECT;
        eachAllocationFails("applySepia", () -> Engine.applySepia(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applyCartoonize", () -> Engine.applyCartoonize(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applyMagicPen", () -> Engine.applyMagicPen(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applyOilpaint", () -> Engine.applyOilpaint(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applyPosterize", () -> Engine.applyPosterize(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applySketch", () -> Engine.applySketch(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applySketchTexture", () -> Engine.applySketchTexture(in, texture, out, W, H),
                new int[][] {out}, a, e);
        eachAllocationFails("applyHalftone", () -> Engine.applyHalftone(in, out, W, H), new int[][] {out}, a, e);
        eachAllocationFails("applySketchPartial", () -> Engine.applySketchPartial(in, mask, out, W, H, rect),
                new int[][] {out}, a, e);
        eachAllocationFails("applyOilpaintPartial", () -> Engine.applyOilpaintPartial(in, mask, out, W, H, rect),
                new int[][] {out}, a, e);
        // The blur's own working memory failing is logged and reported as
        // success with the output untouched, as the effect library always did.
        int[] blurred = new int[N];
        eachAllocationFails("applyOutfocusBlur", () -> {
            int rc = Engine.applyOutfocusBlur(in, blurred, W, H, 3);
            if (!TestHooks.failurePending()) {
                assertArrayEquals(new int[N], blurred);
            }
            return rc;
        }, new int[][] {blurred}, e, Engine.SUCCESS);
    }

    @Test
    void statusOperationsReportAllocationFailure() {
        int[] in = TestPictures.random(N, 3);
        int[] out = new int[N];
        int a = Engine.ERR_ALLOC;
        eachAllocationFails("applyAutoAdjust", () -> Engine.applyAutoAdjust(in, out, W, H), new int[][] {out}, a);
        int[] report = new int[200];
        Arrays.fill(report, -7);
        eachAllocationFails("analyzeFaces", () -> Engine.analyzeFaces(in, W, H, 3, report), new int[][] {report}, a);
        byte[] mask = new byte[N];
        eachAllocationFails("storeMask", () -> Engine.storeMask(mask, W, H, new Rect(1, 1, 9, 9)), new int[0][], a);
        eachAllocationFails("storeObject", () -> Engine.storeObject(in, W, H, new Rect(1, 1, 9, 9)), new int[0][], a);
    }

    @Test
    void blurAndTiltShiftLeaveTheOutputAndKeepNoState() {
        int[] in = TestPictures.random(N, 4);
        byte[] mask = new byte[N];
        Arrays.fill(mask, 0, N / 2, (byte) 1);
        int[] out = new int[N];
        eachAllocationFails("applyBlur", of(() -> Engine.applyBlur(in, mask, out, W, H, 5, new Rect(0, 0, W - 1, H - 1))),
                new int[][] {out});
        eachAllocationFails("applyTiltShift", of(() -> Engine.applyTiltShift(in, out, W, H, H / 2, 3)), new int[][] {out});
        eachAllocationFails("initBlur", () -> Engine.initBlur(in, mask, W, H, new Rect(0, 0, W - 1, H - 1)),
                new int[0][], Engine.ERR_ALLOC);
        // After a failed start the preview has no state and writes nothing.
        TestHooks.failNthAllocation(1);
        assertEquals(Engine.ERR_ALLOC, Engine.initBlur(in, mask, W, H, new Rect(0, 0, W - 1, H - 1)));
        int[] preview = new int[N];
        Engine.runBlurinPreview(in, mask, preview, W, H, 5);
        assertArrayEquals(new int[N], preview);
    }

    @Test
    void portraitSessionAndItsOperations() throws IOException {
        int[] size = new int[2];
        int[] photo = PortraitTest.astronaut(size);
        int w = size[0];
        int h = size[1];
        int a = Engine.ERR_ALLOC;
        TestHooks.failNthAllocation(3);
        assertEquals(a, Engine.initPortrait(photo, w, h, 2, 3, 1, null));
        assertEquals(0, Engine.getportraitstatus(), "a failed start opens no session");
        eachAllocationFails("initPortrait", () -> Engine.initPortrait(photo, w, h, 2, 3, 1, null), new int[0][], a);
        assertEquals(Engine.SUCCESS, Engine.initPortrait(photo, w, h, 2, 3, 1, null));
        int[] out = new int[w * h];
        int[] preview = new int[64 * 64];
        // The full beautifier reports memory running short; the faces smoothed before stay in out.
        eachAllocationFails("runBeautyInPortrait", () -> Engine.runBeautyInPortrait(photo, out, w, h, 4),
                new int[0][], a);
        eachAllocationFails("runFacebeauty", () -> Engine.runFacebeauty(photo, out, w, h), new int[0][], a);
        eachAllocationFails("runBeautyInPortraitPreview",
                () -> Engine.runBeautyInPortraitPreview(photo, w, h, preview, 64, 64, 4), new int[][] {preview}, a);
        eachAllocationFails("runLightenInPortraitPreview",
                () -> Engine.runLightenInPortraitPreview(photo, w, h, preview, 64, 64, 16), new int[][] {preview}, a);
        eachAllocationFails("runOutfocusInPortrait", () -> Engine.runOutfocusInPortrait(photo, out, w, h, 3),
                new int[][] {out}, a, Engine.ERR_EFFECT);
        eachAllocationFails("runOutfocusInPortraitPreview",
                () -> Engine.runOutfocusInPortraitPreview(photo, w, h, preview, 64, 64, 3), new int[][] {preview}, a,
                Engine.ERR_EFFECT);
        assertEquals(Engine.PORTRAIT_OPEN, Engine.getportraitstatus(), "the session survives failed operations");
    }

    @Test
    void backlightKeepsNoStateAfterAFailedAnalysis() {
        int[] in = TestPictures.random(N, 6);
        int[] out = new int[N];
        int a = Engine.ERR_ALLOC;
        eachAllocationFails("autoBLCInit", () -> Engine.autoBLCInit(in, W, H), new int[0][], a);
        assertEquals(Engine.SUCCESS, Engine.autoBLCInit(in, W, H));
        eachAllocationFails("applyBLCSave", () -> Engine.applyBLCSave(in, out, W, H, 80), new int[][] {out}, a);
        // Without room to keep its weights the preview renders as the save does.
        eachAllocationFails("applyGammaTransformPreview", () -> Engine.applyGammaTransformPreview(in, out, W, H, 80),
                new int[][] {out}, a, Engine.SUCCESS);
    }

    @Test
    void eraserReportsAllocationFailureAndGoesBackToIdle() {
        ObjectsTest.Scene s = new ObjectsTest.Scene(60, 44, 9);
        eachAllocationFails("runEraser", () -> {
            int rc = Engine.runEraser(s.pic, s.mask, s.w, s.h, s.rect());
            assertEquals(Engine.ERASER_IDLE, Engine.getEraserStatus());
            return rc;
        }, new int[][] {s.pic}, Engine.ERR_ALLOC);
    }
}
