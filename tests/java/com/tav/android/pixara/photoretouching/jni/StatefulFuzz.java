package com.tav.android.pixara.photoretouching.jni;

import java.util.Arrays;
import java.util.Random;
import java.util.concurrent.atomic.AtomicBoolean;
import java.util.concurrent.atomic.AtomicInteger;

/**
 * Seeded random call sequences over every stateful method of {@link Engine}:
 * portrait, splash, blur, tilt-shift, backlight, saved regions, the selection
 * tools (the lasso session, tap-to-select, grow, fill holes), the eraser
 * controlled from a second thread, effect progress and cancel read from a
 * second thread. Sessions are opened at one size and used at others (1 x N,
 * N x 1, sides up to 2^20, tiny previews), with hostile rectangles, levels and
 * arrays (null, short). After every call it checks that the arrays the method
 * only reads are unchanged, that a refused call (ERR_NULL) wrote nothing, and
 * that progress stays within 0..100. Memory faults are the sanitizer's to
 * find (run it in the sanitizer build).
 *
 * <p>{@code java ... StatefulFuzz [seconds] [seed]}: runs until the time is up
 * (default 60 s) from the seed (default: the clock), prints the seed first so
 * a failure can be replayed, and exits 1 on the first failed check.
 */
public final class StatefulFuzz {
    private static final int[] HOSTILE = {Integer.MIN_VALUE, -100000, -1, 0, 1, 2, 3, 7, 10, 16, 20, 50, 100, 101,
        255, 4096, 1 << 20, Integer.MAX_VALUE};

    private final Random rng;
    private long calls;
    private long progressReads;
    private int w = 16;
    private int h = 12;
    private boolean huge;

    private StatefulFuzz(long seed) {
        rng = new Random(seed);
    }

    /** Thrown on a failed check: the message names the call. */
    static final class Fault extends RuntimeException {
        private static final long serialVersionUID = 1L;

        Fault(String what) {
            super(what);
        }
    }

    // ---- random material ----------------------------------------------------

    private int pick(int... values) {
        return values[rng.nextInt(values.length)];
    }

    private int hostile() {
        return rng.nextInt(3) == 0 ? HOSTILE[rng.nextInt(HOSTILE.length)] : rng.nextInt(40) - 5;
    }

    /**
     * A new picture size now and then: mostly ordinary sizes and strips; now
     * and then, for one call only, one side of 2^19 or 2^20.
     */
    private void maybeResize() {
        if (huge) {
            huge = false;
            w = 1 + rng.nextInt(90);
            h = 1 + rng.nextInt(70);
        }
        if (rng.nextInt(4) != 0) {
            return;
        }
        switch (rng.nextInt(40)) {
            case 0: w = pick(1, 2, 3); h = pick(1 << 19, 1 << 20) / w; huge = true; break;
            case 1: h = pick(1, 2, 3); w = pick(1 << 19, 1 << 20) / h; huge = true; break;
            case 2: case 3: case 4: w = 1; h = 1 + rng.nextInt(5000); break;
            case 5: case 6: case 7: w = 1 + rng.nextInt(5000); h = 1; break;
            case 8: case 9: case 10: case 11: w = 1 + rng.nextInt(3); h = 1 + rng.nextInt(3); break;
            default: w = 1 + rng.nextInt(90); h = 1 + rng.nextInt(70); break;
        }
    }

    private boolean small() {
        return (long) w * h <= 90 * 70;
    }

    /** An int picture of n pixels: mostly exact, sometimes short, rarely null. */
    private int[] ints(long n) {
        int r = rng.nextInt(40);
        if (r == 0) {
            return null;
        }
        int len = (int) Math.min(n, 1 << 21);
        if (r == 1 && len > 0) {
            len--;
        }
        int[] p = new int[len];
        int seed = rng.nextInt();
        for (int i = 0; i < p.length; i++) {
            seed = seed * 1103515245 + 12345;
            p[i] = seed;
        }
        return p;
    }

    private byte[] mask(long n) {
        int r = rng.nextInt(40);
        if (r == 0) {
            return null;
        }
        int len = (int) Math.min(n, 1 << 21);
        if (r == 1 && len > 0) {
            len--;
        }
        byte[] m = new byte[len];
        int kind = rng.nextInt(3);
        for (int i = 0; i < m.length; i++) {
            m[i] = (byte) (kind == 0 ? 1 : kind == 1 ? 0 : rng.nextInt(3));
        }
        return m;
    }

    private Rect rect() {
        switch (rng.nextInt(5)) {
            case 0: return Rect.whole();
            case 1: return new Rect(hostile(), hostile(), hostile(), hostile());
            case 2: return rng.nextInt(10) == 0 ? null : new Rect(0, 0, w - 1, h - 1);
            default:
                int l = rng.nextInt(w);
                int t = rng.nextInt(h);
                return new Rect(l, t, l + rng.nextInt(w), t + rng.nextInt(h));
        }
    }

    // ---- checks --------------------------------------------------------------

    private static int digest(Object a) {
        if (a instanceof int[]) {
            return Arrays.hashCode((int[]) a);
        }
        if (a instanceof byte[]) {
            return Arrays.hashCode((byte[]) a);
        }
        return 0;
    }

    /** One call: the arrays it must only read, the arrays it writes, its result (or null for void). */
    private interface Body {
        Integer run();
    }

    private void call(String name, Object[] reads, Object[] writes, Body body) {
        int[] before = new int[reads.length + writes.length];
        for (int i = 0; i < reads.length; i++) {
            before[i] = digest(reads[i]);
        }
        for (int i = 0; i < writes.length; i++) {
            before[reads.length + i] = digest(writes[i]);
        }
        Integer rc = body.run();
        calls++;
        for (int i = 0; i < reads.length; i++) {
            if (digest(reads[i]) != before[i]) {
                throw new Fault(name + " at " + w + " x " + h + " changed an array it only reads");
            }
        }
        if (rc != null && rc == Engine.ERR_NULL) {
            for (int i = 0; i < writes.length; i++) {
                if (digest(writes[i]) != before[reads.length + i]) {
                    throw new Fault(name + " at " + w + " x " + h + " was refused but wrote its output");
                }
            }
        }
    }

    private static Object[] of(Object... arrays) {
        return arrays;
    }

    // ---- the sessions --------------------------------------------------------

    private void portrait() {
        long n = (long) w * h;
        int[] in = ints(n);
        int[] out = ints(n);
        int pw = pick(1, 2, 3, 17, 64, hostile());
        int ph = pick(1, 2, 3, 13, 48, hostile());
        int[] preview = ints(Math.max(0L, (long) pw * ph));
        int level = hostile();
        int face = pick(-1, 0, 1, 5, hostile());
        switch (rng.nextInt(14)) {
            case 0:
                if (small() || rng.nextInt(4) == 0) {
                    call("initPortrait", of(in), of(), () -> Engine.initPortrait(in, w, h, hostile(), hostile(),
                            hostile(), rng.nextBoolean() ? null : (c, f) -> { }));
                }
                break;
            case 1: Engine.finishPortrait(); break;
            case 2: Engine.setFacebeauty(hostile(), hostile(), hostile()); break;
            case 3: call("runBeautyInPortrait", of(in), of(out), () -> Engine.runBeautyInPortrait(in, out, w, h, level)); break;
            case 4: call("runBeautyInPortraitSingleFace", of(in), of(out),
                    () -> Engine.runBeautyInPortraitSingleFace(in, out, w, h, level, face)); break;
            case 5: call("runBeautyInPortraitPreview", of(in), of(preview),
                    () -> Engine.runBeautyInPortraitPreview(in, w, h, preview, pw, ph, level)); break;
            case 6: call("runBeautyInPortraitSingleFacePreview", of(in), of(preview),
                    () -> Engine.runBeautyInPortraitSingleFacePreview(in, w, h, preview, pw, ph, level, face)); break;
            case 7: call("runLightenInPortrait", of(in), of(out), () -> Engine.runLightenInPortrait(in, out, w, h, level)); break;
            case 8: call("runLightenInPortraitSingleFace", of(in), of(out),
                    () -> Engine.runLightenInPortraitSingleFace(in, out, w, h, level, face)); break;
            case 9: call("runLightenInPortraitPreview", of(in), of(preview),
                    () -> Engine.runLightenInPortraitPreview(in, w, h, preview, pw, ph, level)); break;
            case 10: call("runLightenInPortraitSingleFacePreview", of(in), of(preview),
                    () -> Engine.runLightenInPortraitSingleFacePreview(in, w, h, preview, pw, ph, level, face)); break;
            case 11:
                if (small()) {
                    call("runOutfocusInPortrait", of(in), of(out),
                            () -> Engine.runOutfocusInPortrait(in, out, w, h, pick(-1, 0, 1, 3, 7, 9)));
                }
                break;
            case 12:
                if (small()) {
                    call("runOutfocusInPortraitPreview", of(in), of(preview),
                            () -> Engine.runOutfocusInPortraitPreview(in, w, h, preview, pw, ph, pick(-1, 0, 2, 8)));
                }
                break;
            default:
                call("getportraitstatus", of(), of(), () -> {
                    int s = Engine.getportraitstatus();
                    if (s != 0 && s != Engine.PORTRAIT_OPEN) {
                        throw new Fault("portrait status " + s);
                    }
                    return null;
                });
        }
    }

    private void splash() {
        long n = (long) w * h;
        int[] image = ints(n);
        int[] out = ints(n);
        int pw = pick(1, 2, 7, 40, hostile());
        int ph = pick(1, 2, 5, 30, hostile());
        int[] preview = ints(Math.max(0L, (long) pw * ph));
        switch (rng.nextInt(6)) {
            case 0: call("initSplash", of(), of(image), () -> Engine.initSplash(image, w, h)); break;
            case 1: call("setGrayInSplash", of(image), of(out), () -> Engine.setGrayInSplash(image, out, w, h)); break;
            case 2: call("drawSplash", of(), of(image), () -> Engine.drawSplash(image, hostile(), hostile(), hostile(), w, h)); break;
            case 3: call("drawSplashPreview", of(), of(image, preview), () -> Engine.drawSplashPreview(image, preview,
                    hostile(), hostile(), hostile(), w, h, pw, ph)); break;
            case 4: call("recoverSplash", of(), of(image), () -> Engine.recoverSplash(image, w, h)); break;
            default: Engine.finishSplash();
        }
    }

    private void blur() {
        long n = (long) w * h;
        int[] in = ints(n);
        int[] out = ints(n);
        byte[] mask = mask(n);
        switch (rng.nextInt(10)) {
            case 0: {
                Rect r = rect();
                // With an empty rectangle the mask is filled and cleared again: it is not "read only".
                call("initBlur", r != null && (r.right < r.left || r.top > r.bottom) ? of(in) : of(in, mask), of(),
                        () -> Engine.initBlur(in, mask, w, h, r));
                break;
            }
            case 1: call("runBlurinPreview", of(in, mask), of(out), () -> {
                Engine.runBlurinPreview(in, mask, out, w, h, hostile());
                return null;
            }); break;
            case 2: {
                Rect r = rect();
                call("applyBlur", r != null && (r.right < r.left || r.top > r.bottom) ? of(in) : of(in, mask), of(out),
                        () -> {
                            Engine.applyBlur(in, mask, out, w, h, hostile(), r);
                            return null;
                        });
                break;
            }
            case 3: Engine.destroyBlur(); break;
            case 4: call("initTiltShift", of(in), of(), () -> {
                Engine.initTiltShift(in, w, h);
                return null;
            }); break;
            case 5: call("makeTiltShift", of(in), of(out), () -> {
                Engine.makeTiltShift(in, out, w, h, hostile(), hostile());
                return null;
            }); break;
            case 6: call("applyTiltShift", of(in), of(out), () -> {
                Engine.applyTiltShift(in, out, w, h, hostile(), hostile());
                return null;
            }); break;
            case 7: call("applyMiniature", of(in), of(out), () -> {
                Engine.applyMiniature(in, out, w, h);
                return null;
            }); break;
            case 8:
                if (small()) {
                    call("applyOutfocusBlur", of(in), of(out), () -> Engine.applyOutfocusBlur(in, out, w, h, hostile()));
                }
                break;
            default: Engine.destroyTiltShift();
        }
    }

    private void backlight() {
        long n = (long) w * h;
        int[] in = ints(n);
        int[] out = ints(n);
        switch (rng.nextInt(4)) {
            case 0: call("autoBLCInit", of(in), of(), () -> Engine.autoBLCInit(in, w, h)); break;
            case 1: call("applyGammaTransformPreview", of(in), of(out),
                    () -> Engine.applyGammaTransformPreview(in, out, w, h, hostile())); break;
            case 2: call("applyBLCSave", of(in), of(out), () -> Engine.applyBLCSave(in, out, w, h, hostile())); break;
            default: Engine.DeInitBLC();
        }
    }

    private void savedRegions() {
        long n = (long) w * h;
        Rect r = rect();
        switch (rng.nextInt(6)) {
            case 0: {
                byte[] m = mask(n);
                call("storeMask", of(m), of(), () -> Engine.storeMask(m, w, h, r));
                break;
            }
            case 1: {
                int[] p = ints(n);
                call("storeObject", of(p), of(), () -> Engine.storeObject(p, w, h, r));
                break;
            }
            case 2: {
                byte[] m = mask(n);
                call("recoverMask", of(), of(m), () -> Engine.recoverMask(m, w, h, r));
                break;
            }
            case 3: {
                int[] p = ints(n);
                call("recoverObject", of(), of(p), () -> Engine.recoverObject(p, w, h, r));
                break;
            }
            case 4: Engine.deleteStoredMask(); break;
            default: Engine.deleteStoredObject();
        }
    }

    private void previewBrushes() {
        long n = (long) w * h;
        int[] image = ints(n);
        int pw = pick(1, 2, 9, hostile());
        int ph = pick(1, 2, 7, hostile());
        int[] preview = ints(Math.max(0L, (long) pw * ph));
        switch (rng.nextInt(4)) {
            case 0: call("rubLightenPreview", of(), of(image, preview), () -> Engine.rubLightenPreview(image, preview,
                    hostile(), hostile(), hostile(), hostile(), w, h, pw, ph)); break;
            case 1: call("rubDarkenPreview", of(), of(image, preview), () -> Engine.rubDarkenPreview(image, preview,
                    hostile(), hostile(), hostile(), hostile(), w, h, pw, ph)); break;
            case 2: call("rubPixelizePreview", of(), of(), () -> {
                Engine.rubPixelizePreview(image, preview, hostile(), hostile(), hostile(), hostile(), w, h, pw, ph);
                return null;
            }); break;
            default: {
                int[] out = ints(n);
                call("removeRedeyePreview", of(image), of(), () -> {
                    Engine.removeRedeyePreview(image, out, w, h, hostile(), hostile(), hostile());
                    return null;
                });
            }
        }
    }

    /** An eraser run on a second thread, controlled from this one, ended within a bound. */
    private void eraser() throws InterruptedException {
        int ew = 8 + rng.nextInt(60);
        int eh = 8 + rng.nextInt(50);
        int[] image = new int[ew * eh];
        for (int i = 0; i < image.length; i++) {
            image[i] = 0xFF000000 | (i * 7919);
        }
        byte[] m = new byte[ew * eh];
        int cx = rng.nextInt(ew);
        int cy = rng.nextInt(eh);
        int r = 2 + rng.nextInt(12);
        for (int y = 0; y < eh; y++) {
            for (int x = 0; x < ew; x++) {
                m[y * ew + x] = (byte) ((x - cx) * (x - cx) + (y - cy) * (y - cy) <= r * r ? 1 : rng.nextInt(40) == 0 ? 2 : 0);
            }
        }
        byte[] maskCopy = m.clone();
        Rect rect = rng.nextBoolean() ? Rect.whole() : new Rect(cx - r + hostile() % 4, cy - r, cx + r, cy + r + hostile() % 5);
        AtomicInteger result = new AtomicInteger(Integer.MIN_VALUE);
        Thread run = new Thread(() -> result.set(Engine.runEraser(image, m, ew, eh, rect)));
        run.setDaemon(true);
        run.start();
        int controls = rng.nextInt(30);
        for (int i = 0; i < controls && run.isAlive(); i++) {
            switch (rng.nextInt(7)) {
                case 0: Engine.stopEraser(); break;
                case 1: Engine.reStartEraser(); break;
                case 2: if (rng.nextInt(3) == 0) {
                    Engine.exitEraser();
                }
                    break;
                case 3: Engine.setEraserStatus(pick(Engine.ERASER_IDLE, Engine.ERASER_PAUSED, Engine.ERASER_RUNNING, hostile()));
                    break;
                case 4: {
                    int busy = Engine.runEraser(new int[4], new byte[4], 2, 2, Rect.whole());
                    if (run.isAlive() && busy != Engine.ERR_ERASER_BUSY && busy != Engine.SUCCESS) {
                        throw new Fault("second runEraser during a run gave " + busy);
                    }
                    break;
                }
                case 5: Engine.getEraserStatus(); break;
                default: Thread.sleep(rng.nextInt(3));
            }
            calls++;
        }
        // However the status was left, the run must be reachable: resume or end it.
        long deadline = System.nanoTime() + 20_000_000_000L;
        while (run.isAlive() && System.nanoTime() < deadline) {
            Engine.reStartEraser();
            if (rng.nextBoolean()) {
                Engine.exitEraser();
            }
            run.join(2);
        }
        if (run.isAlive()) {
            throw new Fault("runEraser did not end (status " + Engine.getEraserStatus() + ")");
        }
        int rc = result.get();
        if (rc != Engine.SUCCESS && rc != Engine.ERR_ERASER_BUSY && rc != Engine.ERR_NULL) {
            throw new Fault("runEraser returned " + rc);
        }
        if (!Arrays.equals(maskCopy, m)) {
            throw new Fault("runEraser changed its mask");
        }
        Engine.setEraserStatus(Engine.ERASER_IDLE);
    }

    /** Effects on a second thread; progress read and cancel asked from this one. */
    private void progress() throws InterruptedException {
        int ew = pick(1, 2, 40, 900);
        int eh = pick(1, 2, 30, 900) / (ew >= 900 ? 30 : 1);
        int[] in = ints((long) ew * eh);
        int[] out = new int[ew * eh];
        int kind = rng.nextInt(3);
        AtomicBoolean done = new AtomicBoolean();
        AtomicInteger bad = new AtomicInteger(Engine.SUCCESS);
        Thread run = new Thread(() -> {
            for (int i = 0; i < 3; i++) {
                int rc = kind == 0 ? Engine.applyPosterize(in, out, ew, eh)
                        : kind == 1 ? Engine.applySepia(in, out, ew, eh) : Engine.applySketch(in, out, ew, eh);
                if (rc != Engine.SUCCESS && rc != Engine.ERR_EFFECT && rc != Engine.ERR_NULL) {
                    bad.set(rc);
                }
            }
            done.set(true);
        });
        run.setDaemon(true);
        run.start();
        while (!done.get() && run.isAlive()) {
            int p = Engine.getEffectProgress();
            if (p < 0 || p > 100) {
                throw new Fault("getEffectProgress " + p);
            }
            if (rng.nextInt(50) == 0) {
                Engine.cancelEffect();
            }
            progressReads++;
        }
        run.join(30000);
        if (run.isAlive()) {
            throw new Fault("effect did not end");
        }
        if (bad.get() != Engine.SUCCESS) {
            throw new Fault("effect returned " + bad.get());
        }
    }

    /** A coordinate: mostly inside the picture or just beside it, sometimes hostile. */
    private int coordinate(int side) {
        return rng.nextInt(5) == 0 ? hostile() : rng.nextInt(side + 6) - 3;
    }

    private static void expect(boolean ok, String what) {
        if (!ok) {
            throw new Fault(what);
        }
    }

    /** The lasso's open outline as x, y pairs (empty without a session or points). */
    private static int[] outline() {
        int[] xy = new int[Engine.selectionOutlineLength() * 2];
        expect(xy.length == 0 || Engine.selectionGetOutline(xy) == Engine.SUCCESS, "outline not readable");
        return xy;
    }

    /** A refused or failed lasso call must leave the outline as it was. */
    private static void unchangedUnless(int rc, boolean changed, int[] before, String name) {
        if (!changed) {
            expect(Arrays.equals(before, outline()), name + " gave " + rc + " but changed the outline");
        }
    }

    /**
     * The lasso session (started at one size, used while sizes change),
     * tap-to-select, grow and fill holes. Checks the result codes each call may
     * give and the point count they imply.
     */
    private void selection() {
        long n = (long) w * h;
        int[] image = ints(n);
        byte[] mask = mask(n);
        int x = coordinate(w);
        int y = coordinate(h);
        int before = Engine.selectionPointCount();
        int[] was = outline();
        // Points tapped on the same corner share it, so the outline may be shorter than the list.
        expect(before >= 0 && (before == 0) == (Engine.selectionOutlineLength() == 0), "point count " + before
                + " against outline " + Engine.selectionOutlineLength());
        switch (rng.nextInt(13)) {
            case 0:
                if (small() || rng.nextInt(6) == 0) {
                    call("selectionStart", of(image), of(), () -> {
                        int rc = Engine.selectionStart(image, w, h);
                        expect(rc == Engine.SUCCESS || rc == Engine.ERR_NULL || rc == Engine.ERR_ALLOC,
                                "selectionStart gave " + rc);
                        expect(rc != Engine.SUCCESS || Engine.selectionPointCount() == 0, "a new session has points");
                        return rc;
                    });
                }
                break;
            case 1: case 2: case 3:
                call("selectionAddPoint", of(), of(), () -> {
                    int rc = Engine.selectionAddPoint(x, y);
                    boolean added = rc >= 0 && rc < Engine.SUCCESS;
                    expect(added || rc == Engine.ERR_NULL || rc == Engine.ERR_ALLOC, "selectionAddPoint gave " + rc);
                    expect(Engine.selectionPointCount() == before + (added ? 1 : 0), "point count after adding");
                    unchangedUnless(rc, added, was, "selectionAddPoint");
                    return rc;
                });
                break;
            case 4:
                call("selectionRemovePoint", of(), of(), () -> {
                    int rc = Engine.selectionRemovePoint(x, y);
                    expect(rc == Engine.SUCCESS || rc == Engine.ERR_NULL || rc == Engine.ERR_NO_POINT
                            || rc == Engine.ERR_ALLOC, "selectionRemovePoint gave " + rc);
                    expect(Engine.selectionPointCount() == before - (rc == Engine.SUCCESS ? 1 : 0),
                            "point count after removing");
                    expect(before > 0 || rc != Engine.SUCCESS, "removed a point from an empty list");
                    unchangedUnless(rc, rc == Engine.SUCCESS, was, "selectionRemovePoint");
                    return rc;
                });
                break;
            case 5:
                call("selectionMovePoint", of(), of(), () -> {
                    int rc = Engine.selectionMovePoint(x, y, coordinate(w), coordinate(h));
                    expect(rc == Engine.SUCCESS || rc == Engine.ERR_NULL || rc == Engine.ERR_NO_POINT
                            || rc == Engine.ERR_ALLOC, "selectionMovePoint gave " + rc);
                    expect(Engine.selectionPointCount() == before, "a move changed the point count");
                    unchangedUnless(rc, rc == Engine.SUCCESS, was, "selectionMovePoint");
                    return rc;
                });
                break;
            case 6: {
                int len = Engine.selectionOutlineLength() * 2 + pick(-1, 0, 0, 3);
                int[] xy = rng.nextInt(20) == 0 || len < 0 ? null : new int[len];
                call("selectionGetOutline", of(), of(xy), () -> Engine.selectionGetOutline(xy));
                break;
            }
            case 7: {
                Rect r = rect();
                call("selectionClose", of(), of(mask), () -> {
                    int rc = Engine.selectionClose(mask, w, h, r);
                    expect(rc == Engine.SUCCESS || rc == Engine.ERR_NULL || rc == Engine.ERR_ALLOC,
                            "selectionClose gave " + rc);
                    unchangedUnless(rc, false, was, "selectionClose");
                    return rc;
                });
                break;
            }
            case 8:
                expect(Engine.selectionFinish() == Engine.SUCCESS && Engine.selectionPointCount() == 0
                        && Engine.selectionOutlineLength() == 0, "finish left points behind");
                break;
            case 9: case 10: {
                Rect r = rect();
                call("selectTap", of(image), of(mask), () -> Engine.selectTap(image, mask, w, h, x, y, hostile(),
                        pick(0, 1, 2, hostile()), r));
                break;
            }
            case 11: {
                Rect r = rect();
                call("selectGrow", of(), of(mask), () -> Engine.selectGrow(mask, w, h, pick(-3, -1, 0, 2, hostile()), r));
                break;
            }
            default: {
                Rect r = rect();
                call("selectFillHoles", of(), of(mask), () -> Engine.selectFillHoles(mask, w, h, r));
            }
        }
    }

    private void step() throws InterruptedException {
        maybeResize();
        switch (rng.nextInt(46)) {
            case 40: case 41: case 42: case 43: case 44: case 45: selection(); break;
            case 0: case 1: case 2: case 3: case 4: case 5: case 6: case 7: portrait(); break;
            case 8: case 9: case 10: case 11: splash(); break;
            case 12: case 13: case 14: case 15: case 16: case 17: blur(); break;
            case 18: case 19: case 20: case 21: backlight(); break;
            case 22: case 23: case 24: case 25: case 26: case 27: savedRegions(); break;
            case 28: case 29: case 30: case 31: previewBrushes(); break;
            case 32: eraser(); break;
            case 33: progress(); break;
            default:
                // Sessions ended in any order, any number of times.
                Engine.finishPortrait();
                Engine.destroyBlur();
                Engine.finishSplash();
        }
    }

    /** Leaves no session behind. */
    static void endSessions() {
        Engine.finishPortrait();
        Engine.finishSplash();
        Engine.destroyBlur();
        Engine.destroyTiltShift();
        Engine.DeInitBLC();
        Engine.deleteStoredMask();
        Engine.deleteStoredObject();
        Engine.setEraserStatus(Engine.ERASER_IDLE);
        Engine.setFacebeauty(2, 3, 3);
        Engine.selectionFinish();
    }

    /**
     * Runs sequences for about {@code seconds}; returns the calls made (the
     * progress reads not counted), throws Fault on a failed check.
     */
    static long run(long seed, double seconds) throws InterruptedException {
        return runCounted(seed, seconds)[0];
    }

    /** As {@link #run}: the calls made and the progress reads. */
    static long[] runCounted(long seed, double seconds) throws InterruptedException {
        StatefulFuzz f = new StatefulFuzz(seed);
        long end = System.nanoTime() + (long) (seconds * 1e9);
        try {
            while (System.nanoTime() < end) {
                f.step();
            }
        } finally {
            endSessions();
        }
        return new long[] {f.calls, f.progressReads};
    }

    public static void main(String[] args) throws InterruptedException {
        double seconds = args.length > 0 ? Double.parseDouble(args[0]) : 60;
        long seed = args.length > 1 ? Long.parseLong(args[1]) : System.nanoTime();
        System.out.println("stateful fuzz: seed " + seed + ", " + seconds + " s");
        long start = System.nanoTime();
        try {
            long[] counts = runCounted(seed, seconds);
            System.out.printf("stateful fuzz: %d calls and %d progress reads in %.1f s from seed %d, no fault%n",
                    counts[0], counts[1], (System.nanoTime() - start) / 1e9, seed);
            System.out.println("1 passed, 0 failed");
        } catch (Fault e) {
            System.out.println("stateful fuzz: FAULT from seed " + seed + ": " + e.getMessage());
            System.out.println("0 passed, 1 failed");
            System.exit(1);
        }
        System.exit(0);
    }
}
