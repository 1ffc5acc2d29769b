package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.status;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;

import java.util.List;

/** Backlight correction: analyse, render at a strength, free the analysis. */
final class BacklightOperations {
    private BacklightOperations() {
    }

    static List<Operation> list() {
        Param strength = new Param("strength", 0, 100, 0, 80,
                "0 unchanged, 100 full correction of a backlit subject");
        return List.of(status("backlight", "Fix backlight: brighten a dark subject against a bright sky or window",
                false, List.of(strength), j -> {
                    int rc = Engine.autoBLCInit(j.in, j.width, j.height);
                    if (rc == Engine.SUCCESS) {
                        rc = Engine.applyBLCSave(j.in, j.out, j.width, j.height, j.value("strength"));
                    }
                    Engine.DeInitBLC();
                    return rc;
                }));
    }
}
