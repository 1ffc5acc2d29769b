package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.List;

/**
 * Selection tools: the edge-snapping lasso and tap-to-select write a mask
 * picture (white = selected) usable as {@code mask=} of every regional
 * operation, and an overlay preview beside it ({@code out-overlay.png});
 * {@code lasso-erase} erases through a lasso selection.
 */
final class SelectionOperations {
    private static final int TAPS = 10;

    private SelectionOperations() {
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(new Operation("select-lasso", "Edge-snapping lasso through points=x1,y1,x2,y2,... (without points,"
                + " " + TAPS + " taps on the ellipse of rect=); writes the mask (white = selected) and out-overlay.png",
                true, List.of(new Param("grow", -50, 50, 0, 0, "grow (or shrink, negative) the selection by pixels")),
                SelectionOperations::lasso).withDemoRegion(0.30, 0.22, 0.72, 0.80));
        ops.add(new Operation("select-tap", "Select the region of similar colour around x,y (-1: the centre);"
                + " writes the mask (white = selected) and out-overlay.png", false,
                List.of(new Param("x", -1, 1 << 20, -1, -1, "tapped column, -1 for the centre"),
                        new Param("y", -1, 1 << 20, -1, -1, "tapped row, -1 for the centre"),
                        new Param("tolerance", 0, 100, 50, 50, "colour tolerance"),
                        new Param("fill", 0, 1, 0, 1, "1: fill the holes of the selection")),
                SelectionOperations::tap));
        ops.add(new Operation("lasso-erase", "Erase the object traced by the lasso through points= (or the ellipse"
                + " of rect=), its selection grown by 2 pixels", true, List.of(), SelectionOperations::lassoErase)
                .withDemoRegion(0.40, 0.52, 0.56, 0.66));
        return ops;
    }

    static boolean takesPoints(Operation op) {
        return op.name().equals("select-lasso") || op.name().equals("lasso-erase");
    }

    static int[] parsePoints(String value) throws Glimmer.UsageException {
        String[] parts = value.split(",", -1);
        if (parts.length < 6 || parts.length % 2 != 0) {
            throw new Glimmer.UsageException("points= needs at least 3 x,y pairs, got '" + value + "'");
        }
        int[] p = new int[parts.length];
        for (int i = 0; i < parts.length; i++) {
            try {
                p[i] = Integer.parseInt(parts[i].trim());
            } catch (NumberFormatException e) {
                throw new Glimmer.UsageException("points= holds '" + parts[i] + "', not an integer");
            }
        }
        return p;
    }

    /** The taps: points= as given, or TAPS points on the ellipse inscribed in the job's rectangle. */
    private static int[] taps(Job j) {
        if (j.points != null) {
            return j.points;
        }
        Rect r = j.rect;
        boolean whole = r.right < r.left || r.bottom < r.top;
        double l = whole ? 0 : r.left;
        double t = whole ? 0 : r.top;
        double cx = whole ? j.width / 2.0 : (r.left + r.right) / 2.0;
        double cy = whole ? j.height / 2.0 : (r.top + r.bottom) / 2.0;
        double rx = cx - l;
        double ry = cy - t;
        int[] p = new int[2 * TAPS];
        for (int k = 0; k < TAPS; k++) {
            double a = 2 * Math.PI * k / TAPS;
            p[2 * k] = clamp((int) Math.round(cx + rx * Math.cos(a)), j.width - 1);
            p[2 * k + 1] = clamp((int) Math.round(cy + ry * Math.sin(a)), j.height - 1);
        }
        return p;
    }

    private static int clamp(int v, int max) {
        return Math.max(0, Math.min(max, v));
    }

    private static void check(String what, int rc) throws OperationException {
        if (rc != Engine.SUCCESS) {
            throw new OperationException(what + " failed with result code " + rc);
        }
    }

    /** Runs the lasso over the taps; returns the mask and leaves the outline in {@code outline[0]}. */
    private static byte[] lassoMask(Job j, int[][] outline) throws OperationException {
        int[] p = taps(j);
        check("select-lasso: start", Engine.selectionStart(j.in, j.width, j.height));
        try {
            for (int i = 0; i < p.length; i += 2) {
                int rc = Engine.selectionAddPoint(p[i], p[i + 1]);
                if (rc >= Engine.SUCCESS) {
                    throw new OperationException("select-lasso: point " + p[i] + "," + p[i + 1]
                            + " refused with result code " + rc + " (outside the picture?)");
                }
            }
            byte[] mask = new byte[j.width * j.height];
            check("select-lasso: close", Engine.selectionClose(mask, j.width, j.height, new Rect()));
            int[] xy = new int[Engine.selectionOutlineLength() * 2];
            check("select-lasso: outline", Engine.selectionGetOutline(xy));
            outline[0] = xy;
            return mask;
        } finally {
            Engine.selectionFinish();
        }
    }

    private static void lasso(Job j) throws OperationException {
        int[][] outline = new int[1][];
        byte[] mask = lassoMask(j, outline);
        if (j.value("grow") != 0) {
            check("select-lasso: grow", Engine.selectGrow(mask, j.width, j.height, j.value("grow"), new Rect()));
        }
        writeMask(j, mask);
        j.preview = overlay(j, mask, outline[0], taps(j));
    }

    private static void tap(Job j) throws OperationException {
        int x = j.value("x") < 0 ? j.width / 2 : j.value("x");
        int y = j.value("y") < 0 ? j.height / 2 : j.value("y");
        if (x >= j.width || y >= j.height) {
            throw new OperationException("select-tap: " + x + "," + y + " is outside the " + j.width + "x"
                    + j.height + " picture");
        }
        byte[] mask = new byte[j.width * j.height];
        check("select-tap", Engine.selectTap(j.in, mask, j.width, j.height, x, y, j.value("tolerance"),
                Engine.SELECT_REPLACE, new Rect()));
        if (j.value("fill") == 1) {
            check("select-tap: fill holes", Engine.selectFillHoles(mask, j.width, j.height, new Rect()));
        }
        writeMask(j, mask);
        j.preview = overlay(j, mask, null, new int[] {x, y});
    }

    private static void lassoErase(Job j) throws OperationException {
        int[][] outline = new int[1][];
        byte[] mask = lassoMask(j, outline);
        Rect r = new Rect();
        check("lasso-erase: grow", Engine.selectGrow(mask, j.width, j.height, 2, r));
        System.arraycopy(j.in, 0, j.out, 0, j.in.length);
        if (r.right >= r.left) {
            check("lasso-erase", Engine.runEraser(j.out, mask, j.width, j.height, r));
        }
    }

    private static void writeMask(Job j, byte[] mask) {
        for (int i = 0; i < mask.length; i++) {
            j.out[i] = mask[i] == 1 ? 0xFFFFFFFF : 0xFF000000;
        }
    }

    /**
     * The picture with the unselected part dimmed toward blue, the outline in
     * yellow (each corner drawn on the pixel below and right of it) and the
     * taps as red squares.
     */
    private static int[] overlay(Job j, byte[] mask, int[] outline, int[] taps) {
        int[] o = new int[j.in.length];
        for (int i = 0; i < o.length; i++) {
            int p = j.in[i];
            if (mask[i] == 1) {
                o[i] = 0xFF000000 | p;
            } else {
                int r = ((p >> 16) & 255) / 3;
                int g = ((p >> 8) & 255) / 3;
                int b = (p & 255) / 3 + 70;
                o[i] = 0xFF000000 | r << 16 | g << 8 | b;
            }
        }
        if (outline != null) {
            for (int i = 0; i < outline.length; i += 2) {
                dot(o, j.width, j.height, outline[i], outline[i + 1], 0, 0xFFFFE000);
            }
        }
        int s = Math.max(1, Math.min(j.width, j.height) / 150);
        for (int i = 0; i + 1 < taps.length; i += 2) {
            dot(o, j.width, j.height, taps[i], taps[i + 1], s, 0xFFFF2020);
        }
        return o;
    }

    private static void dot(int[] o, int w, int h, int x, int y, int s, int colour) {
        for (int dy = -s; dy <= s; dy++) {
            for (int dx = -s; dx <= s; dx++) {
                int px = Math.min(w - 1, x + dx);
                int py = Math.min(h - 1, y + dy);
                if (px >= 0 && py >= 0) {
                    o[py * w + px] = colour;
                }
            }
        }
    }
}
