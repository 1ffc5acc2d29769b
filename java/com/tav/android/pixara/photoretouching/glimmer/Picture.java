package com.tav.android.pixara.photoretouching.glimmer;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.awt.image.BufferedImage;
import java.io.File;
import java.io.IOException;
import java.util.Map;
import javax.imageio.ImageIO;

/** A picture read with ImageIO as ARGB pixels, and written back as PNG. */
final class Picture {
    final int width;
    final int height;
    final int[] pixels;

    Picture(int width, int height, int[] pixels) {
        this.width = width;
        this.height = height;
        this.pixels = pixels;
    }

    static Picture read(File file) throws Glimmer.UsageException {
        BufferedImage img;
        try {
            img = ImageIO.read(file);
        } catch (IOException e) {
            throw new Glimmer.UsageException("cannot read " + file + ": " + e.getMessage());
        }
        if (img == null) {
            throw new Glimmer.UsageException(file + " is not a PNG or JPEG picture");
        }
        return of(img);
    }

    static Picture of(BufferedImage img) {
        int w = img.getWidth();
        int h = img.getHeight();
        return new Picture(w, h, img.getRGB(0, 0, w, h, null, 0, w));
    }

    BufferedImage image(int[] argb) {
        return image(argb, width, height);
    }

    /** A picture of its own size (an operation's result may differ from the input's size). */
    static BufferedImage image(int[] argb, int width, int height) {
        BufferedImage img = new BufferedImage(width, height, BufferedImage.TYPE_INT_ARGB);
        img.setRGB(0, 0, width, height, argb, 0, width);
        return img;
    }

    void write(int[] argb, File file) throws java.io.IOException {
        write(argb, width, height, file);
    }

    static void write(int[] argb, int width, int height, File file) throws java.io.IOException {
        File parent = file.getAbsoluteFile().getParentFile();
        if (parent != null && !parent.isDirectory() && !parent.mkdirs()) {
            throw new IOException("cannot create " + parent);
        }
        if (!ImageIO.write(image(argb, width, height), "png", file)) {
            throw new IOException("no PNG writer for " + file);
        }
    }

    /** A job on a copy of the pixels; a rectangle {l, t, r, b} selects an inscribed ellipse. */
    Job job(Map<String, Integer> values, int[] rect) {
        Rect r = rect == null ? Rect.whole() : new Rect(rect[0], rect[1], rect[2], rect[3]);
        byte[] mask = rect == null ? new byte[width * height] : Glimmer.ellipseMask(width, height, r);
        return new Job(pixels.clone(), width, height, mask, r, values);
    }
}
