package com.tav.android.pixara.photoretouching.jni;

import static org.junit.jupiter.api.Assertions.assertArrayEquals;
import static org.junit.jupiter.api.Assertions.assertEquals;
import static org.junit.jupiter.api.Assertions.assertTrue;

import java.util.concurrent.atomic.AtomicInteger;
import org.junit.jupiter.api.AfterEach;
import org.junit.jupiter.api.Nested;
import org.junit.jupiter.api.Test;

/** Object tools through the bridge: the eraser and its controls, copy and paste. */
class ObjectsTest {
    /** A vertical ramp (every row its own grey) with a red disc to erase. */
    static final class Scene {
        final int w;
        final int h;
        final int[] pic;
        final byte[] mask;
        final int cx;
        final int cy;
        final int radius;

        Scene(int w, int h, int radius) {
            this.w = w;
            this.h = h;
            this.radius = radius;
            cx = w / 2;
            cy = h / 2;
            pic = new int[w * h];
            mask = new byte[w * h];
            for (int y = 0; y < h; y++) {
                for (int x = 0; x < w; x++) {
                    int v = 20 + (200 * y) / h;
                    pic[y * w + x] = 0xFF000000 | v << 16 | v << 8 | v;
                    if ((x - cx) * (x - cx) + (y - cy) * (y - cy) <= radius * radius) {
                        mask[y * w + x] = 1;
                        pic[y * w + x] = 0x80FF0000;
                    }
                }
            }
        }

        Rect rect() {
            return new Rect(cx - radius, cy - radius, cx + radius, cy + radius);
        }

        int expected(int x, int y, int alpha) {
            int v = 20 + (200 * y) / h;
            return alpha << 24 | v << 16 | v << 8 | v;
        }
    }

    @AfterEach
    void idle() {
        Engine.setEraserStatus(Engine.ERASER_IDLE);
    }

    @Nested
    class Eraser {
        @Test
        void completeEraseReproducesTheBackgroundAndKeepsAlpha() {
            Scene s = new Scene(80, 60, 10);
            int[] before = s.pic.clone();
            assertEquals(Engine.SUCCESS, Engine.runEraser(s.pic, s.mask, s.w, s.h, s.rect()));
            assertEquals(Engine.ERASER_IDLE, Engine.getEraserStatus());
            for (int y = 0; y < s.h; y++) {
                for (int x = 0; x < s.w; x++) {
                    int i = y * s.w + x;
                    int want = s.mask[i] == 1 ? s.expected(x, y, 0x80) : before[i];
                    assertEquals(want, s.pic[i], "at " + x + "," + y);
                }
            }
        }

        @Test
        void refusedArgumentsAndIdleControls() {
            Scene s = new Scene(20, 20, 3);
            assertEquals(Engine.ERR_NULL, Engine.runEraser(null, s.mask, s.w, s.h, s.rect()));
            assertEquals(Engine.ERR_NULL, Engine.runEraser(s.pic, new byte[5], s.w, s.h, s.rect()));
            assertEquals(Engine.ERR_NULL, Engine.runEraser(s.pic, s.mask, 0, s.h, s.rect()));
            assertEquals(Engine.ERR_ERASER_IDLE, Engine.stopEraser());
            assertEquals(Engine.ERR_ERASER_IDLE, Engine.reStartEraser());
            assertEquals(Engine.ERR_ERASER_IDLE, Engine.exitEraser());
            Engine.setEraserStatus(Engine.ERASER_RUNNING);
            assertEquals(Engine.ERASER_RUNNING, Engine.getEraserStatus());
            assertEquals(Engine.ERR_ERASER_NOT_PAUSED, Engine.reStartEraser());
            int[] copy = s.pic.clone();
            assertEquals(Engine.ERR_ERASER_BUSY, Engine.runEraser(s.pic, s.mask, s.w, s.h, s.rect()));
            assertArrayEquals(copy, s.pic);
        }

        /** Runs the eraser on a worker thread; the test thread is the "second" Java thread. */
        final class Run extends Thread {
            final Scene scene;
            final AtomicInteger result = new AtomicInteger(-1);

            Run(Scene scene) {
                this.scene = scene;
            }

            @Override
            public void run() {
                result.set(Engine.runEraser(scene.pic, scene.mask, scene.w, scene.h, scene.rect()));
            }
        }

        void awaitStatus(int status) throws InterruptedException {
            for (int i = 0; i < 20000 && Engine.getEraserStatus() != status; i++) {
                Thread.sleep(1);
            }
            assertEquals(status, Engine.getEraserStatus());
        }

        @Test
        void stopPausesRestartResumesAndTheResultIsComplete() throws InterruptedException {
            // A large hole keeps the run going long enough to be controlled.
            Scene s = new Scene(400, 300, 70);
            Run run = new Run(s);
            run.start();
            awaitStatus(Engine.ERASER_RUNNING);
            assertEquals(Engine.SUCCESS, Engine.stopEraser());
            awaitStatus(Engine.ERASER_PAUSED);
            // While paused the run stays claimed: a second run is refused.
            assertEquals(Engine.ERR_ERASER_BUSY, Engine.runEraser(new int[4], new byte[4], 2, 2, new Rect(0, 0, 1, 1)));
            assertEquals(Engine.SUCCESS, Engine.reStartEraser());
            run.join();
            assertEquals(Engine.SUCCESS, run.result.get());
            assertEquals(Engine.ERASER_IDLE, Engine.getEraserStatus());
            for (int i = 0; i < s.pic.length; i++) {
                if (s.mask[i] == 1) {
                    assertEquals(0x80, s.pic[i] >>> 24);
                    assertTrue((s.pic[i] & 0xFFFFFF) != 0xFF0000, "filled at " + i);
                }
            }
        }

        int countFilled(Scene s) {
            int n = 0;
            for (int i = 0; i < s.pic.length; i++) {
                if (s.mask[i] == 1 && (s.pic[i] & 0xFFFFFF) != 0xFF0000) {
                    n++;
                }
            }
            return n;
        }

        @Test
        void exitEndsTheRunEarlyWithProgressCommitted() throws InterruptedException {
            Scene s = new Scene(400, 300, 70);
            Run run = new Run(s);
            run.start();
            awaitStatus(Engine.ERASER_RUNNING);
            // The partly filled picture shows up in the array while the run goes on.
            for (int i = 0; i < 20000 && countFilled(s) == 0; i++) {
                Thread.sleep(1);
            }
            assertEquals(Engine.SUCCESS, Engine.stopEraser());
            awaitStatus(Engine.ERASER_PAUSED);
            assertTrue(countFilled(s) > 0, "progress committed to the array during the run");
            assertEquals(Engine.SUCCESS, Engine.exitEraser());
            run.join();
            assertEquals(Engine.ERR_ERASER_BUSY, run.result.get());
            assertEquals(Engine.ERASER_IDLE, Engine.getEraserStatus());
            int filled = 0;
            int left = 0;
            for (int i = 0; i < s.pic.length; i++) {
                if (s.mask[i] == 1) {
                    if ((s.pic[i] & 0xFFFFFF) == 0xFF0000) {
                        left++;
                    } else {
                        filled++;
                    }
                }
            }
            assertTrue(filled > 0, "the filled part reaches the array");
            assertTrue(left > 0, "the run stopped before the end");
            // The next run starts afresh and completes.
            assertEquals(Engine.SUCCESS, Engine.runEraser(s.pic, s.mask, s.w, s.h, s.rect()));
        }
    }

    @Nested
    class CopyAndPaste {
        @Test
        void setObjectRegionClosesNotchesAndWritesTheClippedRectangleBack() {
            byte[] m = {1, 1, 1, 1, 0, 1, 1, 1, 1};
            Rect r = new Rect(-3, -3, 10, 10);
            assertEquals(Engine.SUCCESS, Engine.setObjectRegion(m, 3, 3, r, 1));
            assertEquals(1, m[4]);
            assertEquals(0, r.left);
            assertEquals(0, r.top);
            assertEquals(2, r.right);
            assertEquals(2, r.bottom);
            assertEquals(Engine.ERR_NULL, Engine.setObjectRegion(null, 3, 3, r, 1));
        }

        @Test
        void copyPasteBlendsTheBorderAndClipsThePosition() {
            int[] object = new int[9];
            java.util.Arrays.fill(object, 0xFF646464);
            object[0] = 0xFF747474;  // channel-sum distance 48 from the centre
            byte[] mask = {2, 0, 0, 0, 1, 0, 0, 0, 0};
            int[] pic = new int[25];
            java.util.Arrays.fill(pic, 0xFF141414);
            int[] out = new int[25];
            assertEquals(Engine.SUCCESS, Engine.runCopyPaste(object, pic, mask, out, 3, 3, 5, 5, new Rect(1, 1, 3, 3)));
            // Grey object on a grey picture: the centre keeps 100 and, within
            // 50 of its band neighbour, is drawn 1:7 with the background 20.
            assertEquals(0xFF1E1E1E, out[12], Integer.toHexString(out[12]));
            // Pasted off the picture: nothing outside the arrays is touched.
            assertEquals(Engine.SUCCESS,
                    Engine.runCopyPaste(object, pic, mask, out, 3, 3, 5, 5, new Rect(-2, 4, 0, 6)));
            assertArrayEquals(pic, out);
            assertEquals(Engine.ERR_NULL, Engine.runCopyPaste(object, pic, new byte[3], out, 3, 3, 5, 5, new Rect()));
        }

        @Test
        void pasteCopiesOpaqueObjectPixelsAndRecolourMatchesTheTarget() {
            int[] object = {0xFF010101, 0x00FFFFFF, 0xFF030303, 0xFF040404};
            byte[] mask = {1, 1, 1, 2};
            int[] bg = new int[9];
            java.util.Arrays.fill(bg, 0xFF323232);
            int[] out = new int[9];
            assertEquals(Engine.SUCCESS, Engine.pasteObject(object, bg, mask, out, 2, 2, 3, 3, new Rect(1, 1, 2, 2)));
            assertArrayEquals(new int[] {0xFF323232, 0xFF323232, 0xFF323232, 0xFF323232, 0xFF010101, 0xFF323232,
                0xFF323232, 0xFF030303, 0xFF323232}, out);

            int[] grey = {0x40646464};
            int[] target = {0xFFC86464};
            assertEquals(Engine.SUCCESS, Engine.runCopyObject(grey, new byte[] {1}, 1, 1, target, 1, 1));
            assertEquals(0x40974B4B, grey[0]);
        }

        @Test
        void drawObjectScalesAndStaysInsideBothPictures() {
            int[] src = new int[16];
            for (int i = 0; i < 16; i++) {
                src[i] = i + 1;
            }
            int[] dst = new int[16];
            assertEquals(0, Engine.drawObject(dst, 4, 4, src, 4, 4, 1.0f, new Rect(0, 0, 3, 3)));
            for (int y = 0; y < 4; y++) {
                for (int x = 0; x < 4; x++) {
                    assertEquals(x < 3 ? src[y * 4 + x] : 0, dst[y * 4 + x]);
                }
            }
            assertEquals(0, Engine.drawObject(dst, 4, 4, new int[3], 4, 4, 1.0f, new Rect(0, 0, 3, 3)));
        }

        @Test
        void savedMaskIsRecoveredUntilDeleted() {
            byte[] m = {1, 2, 3, 4};
            assertEquals(0, Engine.storeMask(m, 2, 2, new Rect(0, 0, 1, 1)));
            byte[] back = new byte[4];
            assertEquals(0, Engine.recoverMask(back, 2, 2, new Rect(0, 0, 1, 1)));
            assertArrayEquals(m, back);
            Engine.deleteStoredMask();
            assertEquals(-1, Engine.recoverMask(back, 2, 2, new Rect(0, 0, 1, 1)));
        }
    }
}
