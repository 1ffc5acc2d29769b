package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.List;

/**
 * Filters: texture overlays, tone-curve looks and shader-style effects.
 * Selections go through the partial methods, which leave unselected output
 * pixels as they were; the output therefore starts as a copy of the input.
 * Textures come from {@link Textures} with fixed seeds.
 */
final class FilterOperations {
    private FilterOperations() {
    }

    /** A partial method without textures. */
    @FunctionalInterface
    interface PartialMethod {
        void call(int[] in, byte[] mask, int[] out, int width, int height, Rect rect);
    }

    /** A partial method with one texture. */
    @FunctionalInterface
    interface TexturePartialMethod {
        void call(int[] in, byte[] mask, int[] out, int[] texture, int width, int height, Rect rect);
    }

    /** Draws the texture a filter uses for a picture size. */
    @FunctionalInterface
    interface TextureMaker {
        int[] make(int width, int height);
    }

    static Operation partial(String name, String help, PartialMethod m) {
        return new Operation(name, help, true, List.of(), j -> {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            m.call(j.in, j.mask, j.out, j.width, j.height, j.rect);
        });
    }

    static Operation texture(String name, String help, TextureMaker t, TexturePartialMethod m) {
        return new Operation(name, help, true, List.of(), j -> {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            m.call(j.in, j.mask, j.out, t.make(j.width, j.height), j.width, j.height, j.rect);
        });
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        // texture overlays
        ops.add(new Operation("dawncast", "Dawn cast: warm dark look, sun glow and paper grain", true, List.of(),
                j -> {
                    System.arraycopy(j.in, 0, j.out, 0, j.in.length);
                    Engine.applyDawnCastPartial(j.in, j.mask, j.out, Textures.grain(j.width, j.height, 11),
                            Textures.sunFlare(j.width, j.height, 12), j.width, j.height, j.rect);
                }));
        ops.add(texture("lightstreak", "Light streak: beams of warm light",
                (w, h) -> Textures.lightStreak(w, h, 21), Engine::applyLightStreakPartial));
        ops.add(texture("stardust", "Stardust: a field of stars over the picture",
                (w, h) -> Textures.starField(w, h, 31), Engine::applyStardustPartial));
        ops.add(texture("sunburst", "Sunburst: a bright sun glow",
                (w, h) -> Textures.sunFlare(w, h, 41), Engine::applySunburstPartial));
        ops.add(texture("lightflare", "Light flare: sun glow and lens ghosts on a bright, saturated look",
                (w, h) -> Textures.sunFlare(w, h, 52), Engine::applyLightFlarePartial));
        ops.add(texture("oldphototexture", "Old photo on cream paper",
                (w, h) -> Textures.paper(w, h, 61), Engine::applyOldPhotoTexturePartial));
        // tone-curve looks
        ops.add(partial("retro", "Retro: faded, muted colours", Engine::applyRetroPartial));
        ops.add(partial("yellowglow", "Yellow glow: faded, warm and bright", Engine::applyYellowglowPartial));
        ops.add(partial("nostalgia", "Nostalgia: bright, faded and warm", Engine::applyNostalgiaPartial));
        ops.add(partial("bluewash", "Blue wash: cool and muted", Engine::applyBluewashPartial));
        ops.add(partial("sunshine", "Sunshine: warm and golden", Engine::applySunshinePartial));
        ops.add(partial("vintageregion", "Vintage look on a selection", Engine::applyVintagePartial));
        ops.add(partial("oldphoto", "Old photo: faded sepia print", Engine::applyOldPhotoPartial));
        ops.add(partial("downlight", "Down-light: light from above", Engine::applyDownlightPartial));
        ops.add(partial("softglow", "Soft glow: blooming highlights", Engine::applySoftglowPartial));
        ops.add(new Operation("popart", "Pop art: four flat poster inks", false, List.of(),
                j -> Engine.applyPopArt(j.in, j.out, j.width, j.height)));
        ops.add(partial("sharpen", "Sharpen along rows", (in, mask, out, w, h, r) -> {
            // The masked form clears the mask it is given for an empty
            // rectangle: hand it a copy.
            Engine.applySharpenPartial(in, mask == null ? null : mask.clone(), out, w, h, r);
        }));
        // shader-style effects
        ops.add(partial("turquoise", "Turquoise: compressed range over a blue-green floor",
                Engine::applyTurquoisePartial));
        ops.add(partial("rainbow", "Rainbow: a diagonal rainbow over the picture", Engine::applyRainbowPartial));
        ops.add(partial("gothicnoir", "Gothic noir: hard cold black and white, reds kept as crimson",
                Engine::applyGothicNoirPartial));
        ops.add(partial("vignette", "Vignette: soft round darkening", Engine::applyVignettePartial));
        ops.add(texture("rugged", "Rugged: gritty weathered sandstone", (w, h) -> Textures.grain(w, h, 71),
                Engine::applyRuggedPartial));
        ops.add(texture("oilpastel", "Oil pastel: waxy colour on paper", (w, h) -> Textures.grain(w, h, 81),
                Engine::applyOilPastelPartial));
        ops.add(texture("noirnote", "Noir note: soft warm black-and-white film", (w, h) -> Textures.grain(w, h, 91),
                Engine::applyNoirNotePartial));
        ops.add(new Operation("impressionist", "Impressionist: dabs of paint on canvas", true, List.of(), j -> {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            Engine.applyImpressionistPartial(j.in, j.mask, j.out, Textures.jitter(j.width, j.height, 101),
                    Textures.paper(j.width, j.height, 102), j.width, j.height, j.rect);
        }));
        ops.add(new Operation("stucchevole", "Stucchevole: sugary candy-pastel postcard", true, List.of(), j -> {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            Engine.applyStucchevolePartial(j.in, j.mask, j.out, Textures.sunFlare(j.width, j.height, 111),
                    Textures.paper(j.width, j.height, 112), Textures.starField(j.width, j.height, 113), j.width,
                    j.height, j.rect);
        }));
        return ops;
    }
}
