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

/** Colour tools: hue, RGB balance, point colour, automatic adjustment. */
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
        return ops;
    }
}
