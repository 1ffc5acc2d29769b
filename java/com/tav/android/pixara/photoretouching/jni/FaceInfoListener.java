package com.tav.android.pixara.photoretouching.jni;

/**
 * Receives the faces that {@link Engine#initPortrait} found. The engine calls
 * {@code setFaceInfo(int, int[])} on the object's own class, once, on the
 * calling thread, before {@code initPortrait} returns.
 */
public interface FaceInfoListener {
    /**
     * @param faceCount number of faces found (0 or more)
     * @param faces     9 values per face, in face order: the eye flag (1 for
     *                  every analysed face), the face box x, y, width, height,
     *                  then the two eye points x1, y1, x2, y2 (photo
     *                  coordinates; when no eyes were found these hold the
     *                  mapped marker -1, a small negative number)
     */
    void setFaceInfo(int faceCount, int[] faces);
}
