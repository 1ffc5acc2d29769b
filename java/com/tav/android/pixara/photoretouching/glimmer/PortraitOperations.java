package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.List;

/**
 * Portrait retouching (each run opens a portrait session on the picture,
 * applies one operation to every face found and closes the session) and
 * red-eye removal. Without a face the picture is left as it was.
 */
final class PortraitOperations {
    private PortraitOperations() {
    }

    /** A session operation: (in, out, width, height, value) -> result code. */
    @FunctionalInterface
    interface PortraitMethod {
        int call(int[] in, int[] out, int width, int height, int value);
    }

    private static Operation session(String name, String help, Param param, PortraitMethod m) {
        return new Operation(name, help, false, List.of(param), j -> {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            int[] found = {0};
            // Up to 10 faces, upright and turned ones; the level setting is unchanged.
            int rc = Engine.initPortrait(j.in, j.width, j.height, 10, 0, 3, (count, faces) -> found[0] = count);
            check(name, rc);
            try {
                if (found[0] > 0) {
                    check(name, m.call(j.in, j.out, j.width, j.height, j.value(param.name())));
                }
            } finally {
                Engine.finishPortrait();
            }
        });
    }

    private static void check(String name, int rc) throws OperationException {
        if (rc != Engine.SUCCESS) {
            throw new OperationException(name + " failed with result code " + rc);
        }
    }

    private static void redeye(Job j) {
        System.arraycopy(j.in, 0, j.out, 0, j.in.length);
        Engine.removeRedeye(j.out, j.width, j.height, j.value("x"), j.value("y"), j.value("radius"));
    }

    static List<Operation> list() {
        return List.of(
                session("beautify", "Smooth the skin of every face found",
                        new Param("level", 0, 5, 0, 5, "0 none, 1 light .. 5 strongest"),
                        Engine::runBeautyInPortrait),
                session("light", "Lighten or darken a round area around every face found",
                        new Param("level", 0, 20, 10, 18, "10 neutral; 3 steps of brightness per level above or below"),
                        Engine::runLightenInPortrait),
                session("outfocus", "Blur the background, keeping every face found and its body sharp",
                        new Param("strength", 0, 7, 0, 7, "blur level, 0 none, 7 strongest"),
                        Engine::runOutfocusInPortrait),
                new Operation("redeye", "Remove the red of a pupil around a touched point", false, List.of(
                        new Param("x", 0, 1 << 20, 0, 256, "touched column, pixels"),
                        new Param("y", 0, 1 << 20, 0, 256, "touched row, pixels"),
                        new Param("radius", 1, 1 << 12, 24, 48, "half side of the searched square, pixels")),
                        PortraitOperations::redeye));
    }
}
