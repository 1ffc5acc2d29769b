package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.level;
import static com.tav.android.pixara.photoretouching.glimmer.Operations.region;
import static com.tav.android.pixara.photoretouching.glimmer.Operations.status;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.ArrayList;
import java.util.List;

/** Tone adjustments and the sepia effect. */
final class ToneOperations {
    private ToneOperations() {
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(region("brightness", "Brightness", level(0, 20, 10, 14, "0 darkest, 10 unchanged, 20 brightest"),
                Engine::controlBrightness));
        ops.add(region("brightness100", "Brightness on the 0..100 scale",
                level(0, 100, 50, 70, "50 unchanged"), Engine::controlBrightnessRange100));
        ops.add(region("contrast", "Contrast; channels never cross mid-grey",
                level(0, 20, 10, 16, "0 flat, 10 unchanged, 20 strongest"), Engine::controlContrast));
        ops.add(region("contrast100", "Contrast on the 0..100 scale",
                level(0, 100, 50, 80, "50 unchanged"), Engine::controlContrastRange100));
        ops.add(region("saturation", "Colour saturation",
                level(0, 20, 10, 16, "0 grey, 10 unchanged, 20 twice the colour"), Engine::controlSaturation));
        ops.add(region("saturation100", "Colour saturation on the 0..100 scale",
                level(0, 100, 50, 80, "50 unchanged"), Engine::controlSaturationRange100));
        ops.add(region("temperature", "Colour temperature",
                level(0, 20, 10, 15, "0 coolest, 10 unchanged, 20 warmest"), Engine::controlTemperature));
        ops.add(region("temperature100", "Colour temperature on the 0..100 scale",
                level(0, 100, 50, 25, "50 unchanged"), Engine::controlTemperatureRange100));
        ops.add(region("exposure", "Exposure: channels times level / 10",
                level(0, 40, 10, 14, "10 unchanged"), Engine::controlExposure));
        ops.add(region("faded", "Faded colour film look",
                level(0, 100, 0, 70, "0 unchanged, 100 strongest"), Engine::controlFadedColour));
        ops.add(region("greyscale", "Greyscale with a brightness gain",
                level(0, 20, 10, 10, "10 plain grey"), Engine::controlGreyscale));
        ops.add(status("sepia", "Sepia tone", true, List.of(), j -> Engine.applySepiaPartial(
                j.in, j.mask, j.out, j.width, j.height, j.rect)));
        return ops;
    }
}
