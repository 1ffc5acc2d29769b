package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.level;
import static com.tav.android.pixara.photoretouching.glimmer.Operations.status;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.OperationException;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.ArrayList;
import java.util.List;

/** Selective blur, tilt-shift, miniature and out-focus blur, each through its whole session. */
final class BlurOperations {
    private BlurOperations() {
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        Param blurLevel = level(0, 7, 0, 5, "0 none, 7 strongest");
        // init, a preview, the full blur, destroy: the sequence an editor runs.
        ops.add(new Operation("blur", "Blur the selection (the whole picture without rect); the rest stays sharp",
                true, List.of(blurLevel), j -> {
                    int level = j.value("level");
                    int rc = Engine.initBlur(j.in, j.mask, j.width, j.height, j.rect);
                    if (rc != Engine.SUCCESS) {
                        throw new OperationException("blur failed with result code " + rc);
                    }
                    try {
                        Engine.runBlurinPreview(j.in, j.mask, j.out, j.width, j.height, level);
                        Engine.applyBlur(j.in, j.mask, j.out, j.width, j.height, level, j.rect);
                    } finally {
                        Engine.destroyBlur();
                    }
                }));
        Param centre = new Param("centre", 0, 100, 50, 50, "sharp band centre, per cent of the height from the top");
        Param band = new Param("band", 0, 50, 12, 10, "half height of the sharp band, per cent of the height");
        ops.add(new Operation("tiltshift", "Tilt-shift: a sharp horizontal band, the rest blurred", false,
                List.of(centre, band), j -> {
                    int c = (int) ((long) j.height * j.value("centre") / 100);
                    int half = (int) ((long) j.height * j.value("band") / 100);
                    Engine.initTiltShift(j.in, j.width, j.height);
                    try {
                        Engine.makeTiltShift(j.in, j.out, j.width, j.height, c, half);
                        Engine.applyTiltShift(j.in, j.out, j.width, j.height, c, half);
                    } finally {
                        Engine.destroyTiltShift();
                    }
                }));
        ops.add(new Operation("miniature", "Miniature look: stronger colour and a sharp middle band", false,
                List.of(), j -> Engine.applyMiniature(j.in, j.out, j.width, j.height)));
        ops.add(status("outfocus-blur", "Out-focus blur of the whole picture", false,
                List.of(level(0, 7, 0, 3, "radius 3, 7, 15, 31, 41, 49, 55 or 63 pixels")),
                j -> Engine.applyOutfocusBlur(j.in, j.out, j.width, j.height, j.value("level"))));
        return ops;
    }
}
