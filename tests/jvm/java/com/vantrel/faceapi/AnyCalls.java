// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import android.graphics.Bitmap;
import android.graphics.PointF;
import android.graphics.Rect;
import android.media.Image;
import com.vantrel.faceapi.model.FaceInfo;
import java.io.IOException;
import java.lang.reflect.Array;
import java.lang.reflect.Executable;
import java.lang.reflect.InvocationTargetException;
import java.lang.reflect.Method;
import java.lang.reflect.Modifier;
import java.nio.ByteBuffer;
import java.util.ArrayList;
import java.util.Arrays;
import java.util.Collections;
import java.util.Comparator;
import java.util.List;
import java.util.Map;
import java.util.jar.JarEntry;
import java.util.jar.JarFile;

/** Calls of every public method and constructor of the checked classes, with anything that their types allow. */
final class AnyCalls {
    private static final List<Executable> ALL = all();
    /** A size that frames, planes and transforms often have, so that they belong together. */
    private static final int WIDTH = 12;
    private static final int HEIGHT = 8;

    private final RandomCalls calls;
    /** What is still to come in this round of all of them. */
    private final List<Executable> left = new ArrayList<>();
    private FaceDetector detector = new FaceDetector();
    private FaceTracker tracker = new FaceTracker();
    private FaceVerifier verifier = new FaceVerifier();

    AnyCalls(RandomCalls calls) {
        this.calls = calls;
    }

    /** What is public in the package's jar, but for the native methods that trust their arguments. */
    private static List<Executable> all() {
        List<Executable> found = new ArrayList<>();
        try (JarFile jar = new JarFile(
                CameraFrame.class.getProtectionDomain().getCodeSource().getLocation().getPath())) {
            for (JarEntry entry : Collections.list(jar.entries())) {
                String name = entry.getName();
                if (!name.endsWith(".class")) {
                    continue;
                }
                Class<?> type = Class.forName(name.substring(0, name.length() - 6).replace('/', '.'));
                if (type == FaceLibrary.class || !isPublic(type)) {
                    continue;
                }
                for (Executable executable : type.getConstructors()) {
                    found.add(executable);
                }
                for (Method method : type.getMethods()) {
                    boolean compilers = type.isEnum() && Modifier.isStatic(method.getModifiers());
                    if (method.getDeclaringClass().getName().startsWith("com.vantrel.faceapi.") && !compilers) {
                        found.add(method);
                    }
                }
            }
        } catch (IOException | ClassNotFoundException e) {
            throw new AssertionError(e);
        }
        found.sort(Comparator.comparing(Executable::toGenericString));
        return found;
    }

    private static boolean isPublic(Class<?> type) {
        return Modifier.isPublic(type.getModifiers())
                && (type.getEnclosingClass() == null || isPublic(type.getEnclosingClass()));
    }

    private static String nameOf(Executable executable) {
        StringBuilder name = new StringBuilder("any ");
        name.append(executable.getDeclaringClass().getSimpleName());
        name.append(executable instanceof Method ? "." + executable.getName() : "").append('(');
        String comma = "";
        for (Class<?> type : executable.getParameterTypes()) {
            name.append(comma).append(type.getSimpleName());
            comma = ", ";
        }
        return name.append(')').toString();
    }

    /** Whether the counts have every public method. */
    static boolean allWereCalled(Map<String, int[]> counts) {
        boolean all = true;
        for (Executable executable : ALL) {
            if (!counts.containsKey(nameOf(executable))) {
                System.out.println("never called: " + nameOf(executable));
                all = false;
            }
        }
        return all && ALL.size() > 50;
    }

    void call() throws Exception {
        if (left.isEmpty()) {
            left.addAll(ALL);
            Collections.shuffle(left, calls.random);
        }
        Executable executable = left.remove(left.size() - 1);
        boolean slow = executable.getName().startsWith("extract") || FaceFinder.class.isAssignableFrom(
                executable.getDeclaringClass()) && !(executable instanceof Method);
        String name = nameOf(executable);
        if (slow && calls.counts.containsKey(name) && calls.random.nextInt(50) != 0) {
            return;
        }
        Class<?>[] types = executable.getParameterTypes();
        Object[] arguments = new Object[types.length];
        for (int i = 0; i < types.length; i++) {
            arguments[i] = any(types[i]);
        }
        try {
            Object result;
            if (executable instanceof Method) {
                Object receiver = Modifier.isStatic(executable.getModifiers())
                        ? null : instance(executable.getDeclaringClass());
                result = ((Method) executable).invoke(receiver, arguments);
            } else {
                result = ((java.lang.reflect.Constructor<?>) executable).newInstance(arguments);
                if (result instanceof AutoCloseable) {
                    ((AutoCloseable) result).close();
                }
            }
            calls.count(name, true);
        } catch (InvocationTargetException e) {
            try {
                if (!(e.getCause() instanceof RuntimeException)) {
                    throw e;
                }
                RandomCalls.documented((RuntimeException) e.getCause());
            } catch (Throwable wrong) {
                throw new AssertionError(name + RandomCalls.text(arguments), wrong.getCause() == null
                        ? withCause(wrong, e.getCause()) : wrong);
            }
            calls.count(name, false);
        }
    }

    private static Throwable withCause(Throwable wrong, Throwable cause) {
        return wrong.initCause(cause);
    }

    private Object instance(Class<?> type) {
        if (type == FaceDetector.class || type == FaceTracker.class || type == FaceFinder.class) {
            renew();
            return type == FaceTracker.class ? tracker : detector;
        }
        if (type == FaceVerifier.class) {
            renew();
            return verifier;
        }
        if (type == FaceEngineException.class) {
            return new FaceEngineException("a call", EngineProfile.OPEN, calls.random.nextInt());
        }
        for (int tries = 0; tries < 1000; tries++) {
            Object instance = any(type);
            if (instance != null) {
                return instance;
            }
        }
        throw new AssertionError("nothing here makes a " + type.getSimpleName());
    }

    /** Closed objects serve for a while too. */
    private void renew() {
        if (calls.random.nextInt(20) == 0) {
            detector.close();
            tracker.close();
            verifier.close();
            detector = new FaceDetector();
            tracker = new FaceTracker();
            verifier = new FaceVerifier();
        }
    }

    private int number() {
        switch (calls.random.nextInt(4)) {
            case 0: return calls.absurd();
            case 1: return 90 * calls.random.nextInt(5);
            default: return 1 + calls.random.nextInt(20);
        }
    }

    private float fraction() {
        Float[] floats = {0f, 1f, -1f, 0.5f, Float.NaN, Float.POSITIVE_INFINITY, Float.MAX_VALUE, Float.MIN_VALUE,
            (float) number()};
        return calls.oneOf(floats);
    }

    private int length() {
        Integer[] lengths = {0, 1, 3, 6, 24, 48, 96, 144, 288, 384, 1024, calls.random.nextInt(200)};
        return calls.oneOf(lengths);
    }

    /** Anything of a type; null also where the type is not known here. */
    private Object any(Class<?> type) {
        if (type == int.class) {
            return number();
        }
        if (type == long.class) {
            return (long) number() * (calls.random.nextBoolean() ? 1 : number());
        }
        if (type == float.class) {
            return fraction();
        }
        if (type == boolean.class) {
            return calls.random.nextBoolean();
        }
        if (calls.rarely()) {
            return null;
        }
        if (type == byte[].class) {
            return calls.content(length());
        }
        if (type == int[].class) {
            return new int[length()];
        }
        if (type == ByteBuffer.class) {
            return calls.buffer(length());
        }
        if (type == String.class) {
            return calls.oneOf(new String[] {"", "NV21", "RGBA_TO_NV12", "/nowhere", "\u0000"});
        }
        if (type.isEnum()) {
            return calls.oneOf(type.getEnumConstants());
        }
        if (type == CameraFrame.class) {
            return calls.random.nextBoolean() ? calls.frame()
                    : CameraFrame.of(calls.content(WIDTH * HEIGHT * 3 / 2), PixelFormat.NV12, WIDTH, HEIGHT, 0);
        }
        if (type == Image.class) {
            return image();
        }
        if (type == FaceInfo.class) {
            return calls.anyFace();
        }
        if (type == Feature.class) {
            return calls.decodedFeature();
        }
        if (type == List.class) {
            return Arrays.asList(calls.anyFace(), calls.rarely() ? null : calls.anyFace());
        }
        if (type == Rect.class) {
            return new Rect(number(), number(), number(), number());
        }
        if (type == PointF.class) {
            return new PointF(fraction(), fraction());
        }
        if (type == Bitmap.class) {
            return bitmap();
        }
        if (type == EngineProfile.class) {
            return calls.random.nextBoolean() ? EngineProfile.OPEN : new EngineProfile.Builder().build();
        }
        if (type == EngineProfile.Builder.class) {
            return new EngineProfile.Builder();
        }
        if (type == YuvPlanes.class) {
            return calls.rarely() ? new YuvPlanes() : planes();
        }
        if (type == YuvPlanes.Plane.class) {
            return new YuvPlanes.Plane(calls.buffer(length()), number(), 1 + calls.random.nextInt(2));
        }
        if (type == FrameTransform.class) {
            boolean usual = calls.random.nextInt(4) != 0;
            return FrameTransform.of(usual ? WIDTH : 1 + calls.random.nextInt(16), HEIGHT,
                    90 * calls.random.nextInt(4)).mirrored(calls.random.nextBoolean());
        }
        return type.isArray() ? Array.newInstance(type.getComponentType(), 0) : null;
    }

    private Bitmap bitmap() {
        Bitmap.Config config = calls.rarely() ? Bitmap.Config.RGB_565 : Bitmap.Config.ARGB_8888;
        boolean usual = calls.random.nextBoolean();
        Bitmap bitmap = Bitmap.createBitmap(usual ? WIDTH : 1 + calls.random.nextInt(20),
                usual ? HEIGHT : 1 + calls.random.nextInt(20), config);
        if (calls.rarely()) {
            bitmap = bitmap.copy(config, false);
        }
        if (calls.rarely()) {
            bitmap.recycle();
        }
        return bitmap;
    }

    private Image image() {
        int last = calls.rarely() ? 1 : 0; // a plane that is too short
        YuvPlanesTest.CameraImage image = new YuvPlanesTest.CameraImage(calls.rarely() ? number() : 35, WIDTH, HEIGHT,
                YuvPlanesTest.imagePlane(calls.buffer(WIDTH * HEIGHT), WIDTH, 1),
                YuvPlanesTest.imagePlane(calls.buffer(WIDTH * HEIGHT / 2 - 1), WIDTH, 2),
                YuvPlanesTest.imagePlane(calls.buffer(WIDTH * HEIGHT / 4 - last), WIDTH / 2, 1));
        if (calls.rarely()) {
            image.close();
        }
        return image;
    }

    private YuvPlanes planes() {
        int width = calls.random.nextBoolean() ? WIDTH : 2 + 2 * calls.random.nextInt(8);
        int height = HEIGHT;
        YuvPlanes planes = new YuvPlanes();
        planes.set(width, height, plane(width, height), plane(width / 2, height / 2), plane(width / 2, height / 2));
        return planes;
    }

    private YuvPlanes.Plane plane(int width, int height) {
        ByteBuffer buffer = calls.buffer(width * height);
        while (buffer.isReadOnly()) {
            buffer = calls.buffer(width * height);
        }
        return new YuvPlanes.Plane(buffer, width, 1);
    }
}
