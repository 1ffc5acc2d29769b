package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTimeoutPreemptively;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.time.Duration;
import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Test;

/**
 * Call sequences over the stateful methods that once crashed, hung, stalled or
 * answered wrongly: huge photos previewed into tiny previews, saved regions
 * with far-reaching empty rectangles, a paused eraser whose status was
 * overwritten.
 */
class SequencesTest {
    @AfterEach
    void cleanUp() {
        Engine.finishPortrait();
        Engine.deleteStoredMask();
        Engine.deleteStoredObject();
        Engine.setEraserStatus(Engine.ERASER_IDLE);
    }

    @Test
    void aPhotoSideOf2To19OverAOnePixelPreviewReadsOnlyThePhoto() {
        assertEquals(Engine.SUCCESS, Engine.initPortrait(TestPictures.random(48 * 40, 5), 48, 40, 2, 3, 1, null));
        for (int[] size : new int[][] {{524288, 1}, {1, 524288}, {1 << 20, 1}}) {
            int w = size[0];
            int h = size[1];
            int[] in = TestPictures.random(w * h, w);
            int[] copy = in.clone();
            for (int call = 0; call < 5; call++) {
                int[] preview = {7, 7};
                int rc;
                switch (call) {
                    case 0: rc = Engine.runBeautyInPortraitPreview(in, w, h, preview, 1, 2, 0); break;
                    case 1: rc = Engine.runBeautyInPortraitSingleFacePreview(in, w, h, preview, 1, 2, 0, 0); break;
                    case 2: rc = Engine.runLightenInPortraitPreview(in, w, h, preview, 1, 2, 20); break;
                    case 3: rc = Engine.runLightenInPortraitSingleFacePreview(in, w, h, preview, 1, 2, 20, 0); break;
                    default: rc = Engine.runOutfocusInPortraitPreview(in, w, h, preview, 1, 2, 1); break;
                }
                assertEquals(Engine.SUCCESS, rc, "preview " + call + " of " + w + " x " + h);
                assertTrue(preview[0] == 7 || preview[0] == in[0] || call >= 2, "preview pixel from the photo");
                if (w > 1) {
                    // The second preview row maps beyond the one-row photo: untouched.
                    assertEquals(7, preview[1], "preview " + call + " of " + w + " x " + h);
                }
            }
            assertArrayEquals(copy, in, "the photo is only read");
        }
        // Level 0 is the photo reduced: its first pixel.
        int[] in = TestPictures.random(524288, 9);
        int[] preview = {7, 7};
        assertEquals(Engine.SUCCESS, Engine.runBeautyInPortraitPreview(in, 524288, 1, preview, 1, 2, 0));
        assertArrayEquals(new int[] {in[0], 7}, preview);
    }

    @Test
    void emptySavedRegionRectanglesAreEmptyAndQuickWhateverTheirFarBounds() {
        assertTimeoutPreemptively(Duration.ofSeconds(5), () -> {
            byte[] big = new byte[2000000];
            big[0] = 1;
            assertEquals(0, Engine.storeMask(big, 1000000, 2, new Rect(1, Integer.MIN_VALUE, 0, -2)));
            byte[] mask = new byte[33 * 13];
            int[] image = TestPictures.random(33 * 13, 3);
            Rect tall = new Rect(9, 11, 8, Integer.MAX_VALUE);
            assertEquals(0, Engine.storeMask(mask, 33, 13, tall));
            assertEquals(0, Engine.storeObject(image, 33, 13, tall));
            int[] before = image.clone();
            assertEquals(0, Engine.recoverObject(image, 33, 13, tall));
            assertArrayEquals(before, image);

            // A real region saved, then recovered through far-reaching empty rectangles: nothing moves.
            byte[] painted = new byte[33 * 13];
            java.util.Arrays.fill(painted, (byte) 1);
            assertEquals(0, Engine.storeMask(painted, 33, 13, new Rect(0, 0, 32, 12)));
            byte[] target = new byte[33 * 13];
            assertEquals(0, Engine.recoverMask(target, 33, 13, new Rect(1, Integer.MIN_VALUE, 0, -2)));
            assertEquals(0, Engine.recoverMask(target, 33, 13, tall));
            assertArrayEquals(new byte[33 * 13], target);
            // The saved region is intact and comes back through a real rectangle.
            assertEquals(0, Engine.recoverMask(target, 33, 13, new Rect(0, 0, 32, 12)));
            assertArrayEquals(painted, target);
        });
    }

    @Test
    void anEmptyRectangleSavesAnEmptyRegion() {
        byte[] mask = new byte[6 * 5];
        java.util.Arrays.fill(mask, (byte) 1);
        assertEquals(0, Engine.storeMask(mask, 6, 5, Rect.whole()));
        byte[] target = new byte[6 * 5];
        // Saved, but holding nothing: recovering succeeds and writes nothing.
        assertEquals(0, Engine.recoverMask(target, 6, 5, new Rect(0, 0, 5, 4)));
        assertArrayEquals(new byte[6 * 5], target);
        Engine.deleteStoredMask();
        assertEquals(-1, Engine.recoverMask(target, 6, 5, new Rect(0, 0, 5, 4)));
    }

    /** A large hole on a ramp, erased on a daemon thread (a hang must not keep the JVM alive). */
    private static final class EraserRun {
        final ObjectsTest.Scene scene = new ObjectsTest.Scene(400, 300, 70);
        final AtomicInteger result = new AtomicInteger(-1);
        final Thread thread = new Thread(() -> result.set(
                Engine.runEraser(scene.pic, scene.mask, scene.w, scene.h, scene.rect())));

        EraserRun() {
            thread.setDaemon(true);
            thread.start();
        }
    }

    private static void awaitStatus(int status) throws InterruptedException {
        for (int i = 0; i < 20000 && Engine.getEraserStatus() != status; i++) {
            Thread.sleep(1);
        }
        assertEquals(status, Engine.getEraserStatus());
    }

    /** Retries a control call until it succeeds (the run re-marks its status within a turn). */
    private static void succeedsSoon(java.util.function.IntSupplier control) throws InterruptedException {
        int rc = -1;
        for (int i = 0; i < 2000 && rc != Engine.SUCCESS; i++) {
            rc = control.getAsInt();
            if (rc != Engine.SUCCESS) {
                Thread.sleep(1);
            }
        }
        assertEquals(Engine.SUCCESS, rc);
    }

    @Test
    void aPausedEraserWhoseStatusWasOverwrittenCanStillBeRestartedOrEnded() throws InterruptedException {
        for (int ending = 0; ending < 2; ending++) {
            EraserRun run = new EraserRun();
            awaitStatus(Engine.ERASER_RUNNING);
            assertEquals(Engine.SUCCESS, Engine.stopEraser());
            awaitStatus(Engine.ERASER_PAUSED);
            Engine.setEraserStatus(Engine.ERASER_IDLE);
            // The wait marks the pause again.
            awaitStatus(Engine.ERASER_PAUSED);
            Engine.setEraserStatus(Engine.ERASER_RUNNING);
            succeedsSoon(ending == 0 ? Engine::reStartEraser : Engine::exitEraser);
            run.thread.join(60000);
            assertTrue(!run.thread.isAlive(), "the run ended");
            assertEquals(ending == 0 ? Engine.SUCCESS : Engine.ERR_ERASER_BUSY, run.result.get());
            assertEquals(Engine.ERASER_IDLE, Engine.getEraserStatus());
        }
    }
}
