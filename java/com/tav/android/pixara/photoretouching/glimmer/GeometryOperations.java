package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.Arrays;
import java.util.List;

/** Geometry: turns, flips, straighten, crop, mirror, twirl and sphericity. Several change the picture's size. */
final class GeometryOperations {
    private GeometryOperations() {
    }

    private static Param p(String name, int min, int max, int neutral, int demo, String help) {
        return new Param(name, min, max, neutral, demo, help);
    }

    private static final Param ANGLE_SMALL = p("angle", -45, 45, 0, 8, "degrees, positive clockwise");
    private static final Param SCALE = p("scale", 10, 400, 100, 80,
            "percent of source pixels an output pixel steps; below 100 zooms in");
    private static final Param RADIUS = p("radius", 1, 100, 80, 90, "percent of half the shorter side");
    private static final Param CX = p("cx", 0, 100, 50, 50, "centre, percent of the width");
    private static final Param CY = p("cy", 0, 100, 50, 50, "centre, percent of the height");
    private static final Param HALF = p("half", 0, 1, 0, 0, "1 = half-resolution preview");

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(new Operation("rotate", "Quarter turns (code 1 clockwise, 2 half, 3 counter-clockwise) after flips",
                false, List.of(p("code", 0, 3, 0, 1, "0 none, 1 clockwise, 2 half turn, 3 counter-clockwise"),
                        p("hflip", 0, 1, 0, 0, "1 = flip left-right first"),
                        p("vflip", 0, 1, 0, 0, "1 = flip top-bottom first")),
                j -> rotateFlip(j, j.value("code"), j.value("hflip"), j.value("vflip"))));
        ops.add(new Operation("flip", "Flip left-right and/or top-bottom", false,
                List.of(p("horizontal", 0, 1, 1, 1, "1 = flip left-right"),
                        p("vertical", 0, 1, 0, 0, "1 = flip top-bottom")),
                j -> {
                    int h = j.value("horizontal");
                    int v = j.value("vertical");
                    rotateFlip(j, h == 1 || v == 1 ? 4 : 0, h, v);
                }));
        ops.add(new Operation("turn", "Free rotation of the rectangle (whole picture by default) into its bounding box",
                true, List.of(p("angle", -180, 180, 0, 30, "degrees, positive clockwise")), GeometryOperations::turn));
        ops.add(new Operation("straighten", "Small rotation with zoom, same size", false, List.of(ANGLE_SMALL, SCALE),
                j -> Engine.runStraighten(j.in, j.out, j.width, j.height, j.value("angle"),
                        j.value("scale") / 100f)));
        ops.add(new Operation("straighten-move", "Straighten preview while dragging: turned, shown scale times as large",
                false, List.of(ANGLE_SMALL, p("scale", 10, 400, 100, 90, "percent of the shown size")),
                j -> Engine.runStraightenOnMove(j.in, j.width, j.height, j.out, j.width, j.height, j.value("angle"),
                        j.value("scale") / 100f)));
        ops.add(new Operation("straighten-up", "Straighten when the drag ends: the centred source-sized area",
                false, List.of(ANGLE_SMALL, SCALE),
                j -> Engine.runStraightenOnUp(j.in, j.width, j.height, j.out, j.width, j.height, j.value("angle"),
                        j.value("scale") / 100f)));
        ops.add(new Operation("crop", "Crop to the rectangle", true, List.of(), GeometryOperations::crop));
        ops.add(new Operation("mirror", "Keep one side of a line and reflect it onto the other", false,
                List.of(p("axis", 0, 1, 0, 0, "0 = vertical line (left-right), 1 = horizontal line (up-down)"),
                        p("keep", 0, 1, 0, 0, "0 = keep left / top, 1 = keep right / bottom"),
                        p("pos", 0, 100, 50, 60, "line position, percent of the width or height")),
                GeometryOperations::mirror));
        ops.add(new Operation("twirl", "Twirl the circle, fading to none at the rim", true,
                List.of(p("angle", -360, 360, 0, 200, "degrees at the centre"), RADIUS, CX, CY, HALF),
                j -> circle(j, "twirl", true)));
        ops.add(new Operation("sphericity", "Bulge (positive) or pinch (negative) the circle", true,
                List.of(p("strength", -100, 100, 0, 60, "positive bulges, negative pinches"), RADIUS, CX, CY, HALF),
                j -> circle(j, "sphericity", false)));
        return ops;
    }

    private static void check(String name, int rc) throws OperationException {
        if (rc != Engine.SUCCESS) {
            throw new OperationException(name + " failed with result code " + rc);
        }
    }

    /** The job's rectangle clipped to the picture; the whole picture when it is empty. */
    private static Rect area(Job j) throws OperationException {
        Rect r = j.rect;
        if (r == null || r.right < r.left || r.bottom < r.top) {
            return new Rect(0, 0, j.width - 1, j.height - 1);
        }
        Rect c = new Rect(Math.max(r.left, 0), Math.max(r.top, 0), Math.min(r.right, j.width - 1),
                Math.min(r.bottom, j.height - 1));
        if (c.right < c.left || c.bottom < c.top) {
            throw new OperationException("rect " + r + " lies outside the " + j.width + "x" + j.height + " picture");
        }
        return c;
    }

    private static void rotateFlip(Job j, int code, int h, int v) throws OperationException {
        int[] px = j.in.clone();
        check("rotate", Engine.runRotateFlip(px, j.width, j.height, code, h == 1, v == 1));
        boolean across = code == 1 || code == 3;
        j.replaceResult(px, across ? j.height : j.width, across ? j.width : j.height);
    }

    private static void turn(Job j) throws OperationException {
        Rect r = area(j);
        int cw = r.right - r.left + 1;
        int ch = r.bottom - r.top + 1;
        int angle = j.value("angle");
        int ow = Math.max(1, Engine.getRotateWidth(cw, ch, angle));
        int oh = Math.max(1, Engine.getRotateHeight(cw, ch, angle));
        byte[] srcMask = new byte[j.width * j.height];
        Arrays.fill(srcMask, (byte) 1);
        int[] out = new int[ow * oh];
        // One source pixel an output pixel: the whole region fits its bounding box.
        check("turn", Engine.runRotateN(j.in, srcMask, out, new byte[ow * oh], j.width, j.height, ow, oh, angle, r,
                cw, ch));
        j.replaceResult(out, ow, oh);
    }

    private static void crop(Job j) throws OperationException {
        Rect r = area(j);
        int[] px = j.in.clone();
        check("crop", Engine.runCrop(px, j.width, j.height, r));
        j.replaceResult(px, r.right - r.left + 1, r.bottom - r.top + 1);
    }

    private static void mirror(Job j) throws OperationException {
        boolean upDown = j.value("axis") == 1;
        boolean second = j.value("keep") == 1;
        int axis = upDown ? Engine.MIRROR_AXIS_UP_DOWN : Engine.MIRROR_AXIS_LEFT_RIGHT;
        int mode = upDown ? (second ? Engine.MIRROR_KEEP_BOTTOM : Engine.MIRROR_KEEP_TOP)
                : (second ? Engine.MIRROR_KEEP_RIGHT : Engine.MIRROR_KEEP_LEFT);
        int pos = (int) ((long) j.value("pos") * ((upDown ? j.height : j.width) - 1) / 100);
        int ow = Engine.getMirrorOutwidth(j.width, pos, mode, axis);
        int oh = Engine.getMirrorOutheight(j.height, pos, mode, axis);
        int[] out = new int[ow * oh];
        check("mirror", Engine.runMirror(j.in, out, j.width, j.height, pos, mode, axis));
        j.replaceResult(out, ow, oh);
    }

    private static void circle(Job j, String name, boolean twirl) throws OperationException {
        Rect r = area(j);
        int cx = (int) ((long) j.value("cx") * (j.width - 1) / 100);
        int cy = (int) ((long) j.value("cy") * (j.height - 1) / 100);
        int radius = Math.max(1, (int) ((long) j.value("radius") * (Math.min(j.width, j.height) / 2) / 100));
        boolean half = j.value("half") == 1;
        if (twirl) {
            int angle = j.value("angle");
            int rc = Engine.runTwirl(j.in, j.out, j.width, j.height, cx, cy, radius, angle, r, half);
            // Angle 0 only copies and answers with a value that is no result code.
            if (angle != 0) {
                check(name, rc);
            }
        } else {
            check(name, Engine.runSphericity(j.in, j.out, j.width, j.height, cx, cy, radius, j.value("strength"), r,
                    half));
        }
    }
}
