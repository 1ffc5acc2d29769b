package com.tav.android.pixara.photoretouching.glimmer;

import static com.tav.android.pixara.photoretouching.glimmer.Operations.status;

import com.tav.android.pixara.photoretouching.glimmer.Operations.Job;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Operation;
import com.tav.android.pixara.photoretouching.glimmer.Operations.Param;
import com.tav.android.pixara.photoretouching.jni.Engine;
import com.tav.android.pixara.photoretouching.jni.Rect;

import java.util.ArrayList;
import java.util.List;

/** Object tools: the object eraser and object copy and paste. */
final class ObjectOperations {
    private ObjectOperations() {
    }

    static List<Operation> list() {
        List<Operation> ops = new ArrayList<>();
        ops.add(status("erase", "Remove the selected object (rect= selects an ellipse, mask=file.png a painted mask)",
                true, List.of(), ObjectOperations::erase).withDemoRegion(0.40, 0.52, 0.56, 0.66));
        ops.add(status("copy-paste", "Copy the selected object (rect= ellipse) and paste it at x,y, recoloured and"
                + " with its border blended", true,
                List.of(new Param("x", -100000, 100000, 0, 16, "left edge of the pasted object"),
                        new Param("y", -100000, 100000, 0, 16, "top edge of the pasted object")),
                ObjectOperations::copyPaste));
        return ops;
    }

    /** The bounding box of the selected pixels, or an empty rectangle. */
    static Rect bounds(byte[] mask, int width, int height, Rect within) {
        Rect b = new Rect(Integer.MAX_VALUE, Integer.MAX_VALUE, -1, -1);
        boolean whole = within.right < within.left || within.bottom < within.top;
        int x0 = whole ? 0 : Math.max(0, within.left);
        int x1 = whole ? width - 1 : Math.min(width - 1, within.right);
        int y0 = whole ? 0 : Math.max(0, within.top);
        int y1 = whole ? height - 1 : Math.min(height - 1, within.bottom);
        for (int y = y0; y <= y1; y++) {
            for (int x = x0; x <= x1; x++) {
                if (mask[y * width + x] == 1) {
                    b.left = Math.min(b.left, x);
                    b.right = Math.max(b.right, x);
                    b.top = Math.min(b.top, y);
                    b.bottom = Math.max(b.bottom, y);
                }
            }
        }
        return b.right < 0 ? new Rect(0, 0, -1, -1) : b;
    }

    private static int erase(Job j) {
        System.arraycopy(j.in, 0, j.out, 0, j.in.length);
        Rect r = bounds(j.mask, j.width, j.height, j.rect);
        if (r.right < r.left) {
            return Engine.SUCCESS;  // nothing selected
        }
        return Engine.runEraser(j.out, j.mask, j.width, j.height, r);
    }

    /**
     * The object is the selection's bounding box; its mask marks the selected
     * pixels 1 and, around them, a one-pixel border band of 2 (unselected
     * pixels touching the selection), which the paste blends with the new
     * background.
     */
    private static int copyPaste(Job j) {
        Rect r = bounds(j.mask, j.width, j.height, j.rect);
        if (r.right < r.left) {
            System.arraycopy(j.in, 0, j.out, 0, j.in.length);
            return Engine.SUCCESS;
        }
        int left = Math.max(0, r.left - 1);
        int top = Math.max(0, r.top - 1);
        int ow = Math.min(j.width - 1, r.right + 1) - left + 1;
        int oh = Math.min(j.height - 1, r.bottom + 1) - top + 1;
        int[] object = new int[ow * oh];
        byte[] mask = new byte[ow * oh];
        for (int y = 0; y < oh; y++) {
            for (int x = 0; x < ow; x++) {
                object[y * ow + x] = j.in[(top + y) * j.width + left + x];
                mask[y * ow + x] = j.mask[(top + y) * j.width + left + x] == 1 ? (byte) 1 : 0;
            }
        }
        for (int y = 0; y < oh; y++) {
            for (int x = 0; x < ow; x++) {
                if (mask[y * ow + x] != 0) {
                    continue;
                }
                boolean touches = false;
                for (int dy = -1; dy <= 1 && !touches; dy++) {
                    for (int dx = -1; dx <= 1; dx++) {
                        int yy = y + dy;
                        int xx = x + dx;
                        if (yy >= 0 && yy < oh && xx >= 0 && xx < ow && mask[yy * ow + xx] == 1) {
                            touches = true;
                            break;
                        }
                    }
                }
                if (touches) {
                    mask[y * ow + x] = 2;
                }
            }
        }
        Rect at = new Rect(j.value("x"), j.value("y"), j.value("x") + ow - 1, j.value("y") + oh - 1);
        return Engine.runCopyPaste(object, j.in, mask, j.out, ow, oh, j.width, j.height, at);
    }
}
