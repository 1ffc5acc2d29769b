package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.status;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.ArrayList;
import java.util.List;

/** Painterly, halftone, kaleidoscope, reflection, region and vintage effects. */
final class EffectOperations {
    private EffectOperations() {
    }

    /** A paper texture for the sketch: a fine, seeded grain around light grey. */
    static int[] paper(int width, int height) {
        int[] t = new int[width * height];
        java.util.Random r = new java.util.Random(7);
        for (int i = 0; i < t.length; i++) {
            int v = 200 + r.nextInt(56);
            t[i] = 0xFF000000 | v << 16 | v << 8 | v;
        }
        return t;
    }

    /** Region effects: the touch point in per cent of the picture, then the level. */
    private static List<Param> touch(int min, int max, int demo) {
        return List.of(new Param("x", 0, 100, 50, 50, "touch x in % of the width"),
                new Param("y", 0, 100, 50, 50, "touch y in % of the height"),
                new Param("level", min, max, 0, demo, "strength; the sign lightens or darkens"));
    }

    @FunctionalInterface
    private interface TouchMethod {
        int call(int[] in, int[] out, int width, int height, int x, int y, int level);
    }

    private static Operation region(String name, String help, int min, int max, int demo, TouchMethod m) {
        return new Operation(name, help, false, touch(min, max, demo), j -> {
            int x = Math.min(j.width - 1, j.value("x") * j.width / 100);
            int y = Math.min(j.height - 1, j.value("y") * j.height / 100);
            int rc = m.call(j.in, j.out, j.width, j.height, x, y, j.value("level"));
            if (rc != 0) {
                throw new OperationException(name + " failed with result code " + rc);
            }
        });
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(status("cartoon", "Cartoon: outlines and flat tones", true, List.of(),
                j -> Engine.applyCartoonizePartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("posterize", "Posterize: six levels a channel", true, List.of(),
                j -> Engine.applyPosterizePartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("sketch", "Pencil sketch", true, List.of(),
                j -> Engine.applySketchPartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("sketchpaper", "Pencil sketch on paper grain", true, List.of(),
                j -> Engine.applySketchTexturePartial(j.in, paper(j.width, j.height), j.out, j.mask, j.width,
                        j.height, j.rect)));
        ops.add(status("magicpen", "Magic pen: glowing outlines", true, List.of(),
                j -> Engine.applyMagicPenPartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("oilpaint", "Oil paint", true, List.of(),
                j -> Engine.applyOilpaintPartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("halftone", "Colour halftone dots", true, List.of(),
                j -> Engine.applyHalftonePartial(j.in, j.mask, j.out, j.width, j.height, j.rect)));
        ops.add(status("kaleidoscope", "Kaleidoscope of the picture's centre", false, List.of(),
                j -> Engine.applyKaleidoscope(j.in, j.out, j.width, j.height)));
        ops.add(new Operation("reflection", "Reflection of the upper part, fading downwards", false,
                List.of(new Param("percent", 50, 99, 70, 65, "rows kept, in % of the height")), j -> {
                    int keep = Math.max(j.height * j.value("percent") / 100, (j.height + 1) / 2);
                    if (keep >= j.height) {
                        throw new OperationException("reflection: the picture is too short");
                    }
                    Engine.applyReflection(j.in, j.out, j.width, j.height, keep);
                }));
        ops.add(region("regionbrightness", "Brightness of the touched tonal half", -50, 50, 8,
                Engine::applyRegionBasedBrightness));
        ops.add(region("regioncontrast", "Contrast of the touched tonal half", -10, 10, 3,
                Engine::applyRegionBasedContrast));
        ops.add(region("regionexposure", "Exposure of the touched tonal half", -7, 7, 4,
                Engine::applyRegionBasedExposure));
        ops.add(new Operation("vintage", "Warm, faded vintage look", false, List.of(),
                j -> Engine.applyVintage(j.in, j.out, j.width, j.height)));
        return ops;
    }
}
