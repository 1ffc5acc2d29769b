package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.level;
import static com.tav.android.pixara.photoretouching.glimmer.Operations.region;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.List;

/** Colour tools: hue, RGB balance, point colour, automatic adjustment, brushes, splash, pixelize, invert, lens tints. */
final class ColourOperations {
    private ColourOperations() {
    }

    /** A whole-picture method (in, out, width, height). */
    @FunctionalInterface
    interface WholeMethod {
        void call(int[] in, int[] out, int width, int height);
    }

    /** A region method with three levels. */
    @FunctionalInterface
    interface BalanceMethod {
        void call(int[] in, byte[] mask, int[] out, int width, int height, int red, int green, int blue,
                Rect rect);
    }

    static Operation whole(String name, String help, WholeMethod m) {
        return new Operation(name, help, false, List.of(), j -> m.call(j.in, j.out, j.width, j.height));
    }

    static Operation balance(String name, String help, int max, int neutral, int[] demo, BalanceMethod m) {
        List<Param> params = List.of(
                new Param("red", 0, max, neutral, demo[0], neutral + " unchanged"),
                new Param("green", 0, max, neutral, demo[1], neutral + " unchanged"),
                new Param("blue", 0, max, neutral, demo[2], neutral + " unchanged"));
        return new Operation(name, help, true, params, j -> m.call(j.in, j.mask, j.out, j.width, j.height,
                j.value("red"), j.value("green"), j.value("blue"), j.rect));
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(region("hue", "Hue rotation by level * 18 degrees",
                level(0, 20, 0, 4, "0 unchanged, 10 opposite hue"), Engine::controlHue));
        ops.add(region("hue100", "Hue rotation on the 0..100 scale",
                level(0, 100, 50, 30, "50 unchanged"), Engine::controlHueRange100));
        ops.add(balance("rgb", "Red, green, blue balance", 20, 10, new int[] {13, 10, 8}, Engine::adjustRGB));
        ops.add(balance("rgb100", "Red, green, blue balance on the 0..100 scale", 100, 50, new int[] {40, 50, 75},
                Engine::adjustRGBRange100));
        ops.add(whole("pointred", "Point colour: keep reds, grey elsewhere", Engine::applyPointColorRed));
        ops.add(whole("pointgreen", "Point colour: keep greens, grey elsewhere", Engine::applyPointColorGreen));
        ops.add(whole("pointblue", "Point colour: keep blues, grey elsewhere", Engine::applyPointColorBlue));
        ops.add(whole("pointyellow", "Point colour: keep yellows, grey elsewhere", Engine::applyPointColorYellow));
        ops.add(new Operation("autoadjust", "Automatic tone correction", false, List.of(
                new Param("threshold", 0, 127, 70, 70, "percent of bright pixels for a bright picture"),
                new Param("cutoff", 0, 100, 100, 100, "tone curve height in percent"),
                new Param("weight1", 300, 8196, 1000, 1000, "flattening weight of other pictures"),
                new Param("weight2", 300, 8196, 5120, 5120, "flattening weight of bright pictures")), j -> {
                    Engine.setAutoAdjust(j.value("threshold"), j.value("cutoff"), j.value("weight1"),
                            j.value("weight2"));
                    int rc = Engine.applyAutoAdjust(j.in, j.out, j.width, j.height);
                    if (rc != Engine.SUCCESS) {
                        throw new OperationException("autoadjust failed with result code " + rc);
                    }
                }));
        ops.add(brush("lighten", "Lighten brush: a few strokes across the picture", "strength", 0, 255, 60,
                (img, x, y, r, v, w, h) -> Engine.rubLighten(img, x, y, r, v, w, h)));
        ops.add(brush("darken", "Darken brush: a few strokes across the picture", "strength", 0, 255, 60,
                (img, x, y, r, v, w, h) -> Engine.rubDarken(img, x, y, r, v, w, h)));
        ops.add(brush("rubpixelize", "Pixelize brush: a few strokes across the picture", "shift", 0, 6, 3,
                (img, x, y, r, v, w, h) -> {
                    Engine.rubPixelize(img, x, y, r, v, w, h);
                    return Engine.SUCCESS;
                }));
        ops.add(new Operation("splash", "Colour splash: grey picture, colour brought back along a stroke", false,
                List.of(new Param("radius", 1, 2048, 60, 60, "brush radius in pixels")), j -> {
                    System.arraycopy(j.in, 0, j.out, 0, j.in.length);
                    check("splash", Engine.initSplash(j.out, j.width, j.height));
                    try {
                        for (int[] p : strokes(j)) {
                            check("splash", Engine.drawSplash(j.out, p[0], p[1], j.value("radius"), j.width, j.height));
                        }
                    } finally {
                        Engine.finishSplash();
                    }
                }));
        ops.add(new Operation("pixelize", "Pixelize in cells of 2^shift pixels", false,
                List.of(new Param("shift", 0, 8, 0, 3, "0 unchanged, 3 gives 8 x 8 cells")),
                j -> Engine.applyPixelize(j.in, j.out, j.width, j.height, j.value("shift"))));
        ops.add(new Operation("invert", "Invert colours", true, List.of(),
                j -> Engine.applyInvert(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(lens("edgelens", "Coloured band along the edges", Engine::controlEdgeLens));
        ops.add(lens("toplens", "Coloured band down from the top", Engine::controlTopLens));
        return ops;
    }

    /** A brush method: (image, cx, cy, radius, value, width, height) -> result code. */
    @FunctionalInterface
    interface BrushMethod {
        int call(int[] image, int cx, int cy, int radius, int value, int width, int height);
    }

    /** A lens method: (in, out, width, height, level, size). */
    @FunctionalInterface
    interface LensMethod {
        void call(int[] in, int[] out, int width, int height, int level, int size);
    }

    /** The fixed dabs of a demo stroke: a gentle diagonal through the middle of the picture. */
    static int[][] strokes(Operations.Job j) {
        double[][] at = {{0.25, 0.35}, {0.35, 0.42}, {0.45, 0.48}, {0.55, 0.52}, {0.65, 0.58}, {0.75, 0.65}};
        int[][] p = new int[at.length][];
        for (int i = 0; i < at.length; i++) {
            p[i] = new int[] {(int) (at[i][0] * j.width), (int) (at[i][1] * j.height)};
        }
        return p;
    }

    static void check(String name, int rc) throws OperationException {
        if (rc != Engine.SUCCESS) {
            throw new OperationException(name + " failed with result code " + rc);
        }
    }

    static Operation brush(String name, String help, String value, int min, int max, int demo, BrushMethod m) {
        return new Operation(name, help, false, List.of(
                new Param(value, min, max, demo, demo, value.equals("shift") ? "cells of 2^shift pixels"
                        : "change at the brush centre"),
                new Param("radius", 1, 2048, 60, 60, "brush radius in pixels")), j -> {
                    System.arraycopy(j.in, 0, j.out, 0, j.in.length);
                    for (int[] p : strokes(j)) {
                        check(name, m.call(j.out, p[0], p[1], j.value("radius"), j.value(value), j.width, j.height));
                    }
                });
    }

    static Operation lens(String name, String help, LensMethod m) {
        return new Operation(name, help, false, List.of(
                new Param("hue", 0, 20, 0, 12, "tint hue: level * 18 degrees"),
                new Param("size", 0, 100, 0, 40, "band width in percent, 0 none")),
                j -> m.call(j.in, j.out, j.width, j.height, j.value("hue"), j.value("size")));
    }
}
