// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import java.io.File;
import java.io.FileInputStream;
import java.io.IOException;
import java.io.InputStream;
import java.util.Arrays;
import java.util.List;
import java.util.Scanner;

/** Loads the native library. */
final class NativeLibrary {
    private static final String NAME = "jni_kyface_api";
    private static final String SENTENCE =
            "libjni_kyface_api.so for x86_64 needs a processor with AVX2 and FMA, which this one is not";

    private NativeLibrary() {}

    /**
     * Loads it, if that is not done yet.
     *
     * @throws UnsatisfiedLinkError where it cannot be loaded; the message says why
     */
    static void load() {
        try {
            System.loadLibrary(NAME);
        } catch (UnsatisfiedLinkError error) {
            throw explained(error, System.getProperty("os.arch"), new File("/proc/cpuinfo"));
        }
    }

    /**
     * The error with its reason. The library itself throws one where the processor lacks what it is compiled for, but
     * Android's virtual machine drops that for a message of its own.
     */
    static UnsatisfiedLinkError explained(UnsatisfiedLinkError error, String architecture, File processors) {
        if (SENTENCE.equals(error.getMessage()) || !Arrays.asList("x86_64", "amd64").contains(architecture)) {
            return error;
        }
        try (InputStream in = new FileInputStream(processors); Scanner lines = new Scanner(in, "UTF-8")) {
            while (lines.hasNextLine()) {
                List<String> words = Arrays.asList(lines.nextLine().trim().split("\\s+"));
                if (words.get(0).startsWith("flags")) {
                    boolean enough = words.contains("avx2") && words.contains("fma");
                    return enough ? error : (UnsatisfiedLinkError) new UnsatisfiedLinkError(SENTENCE).initCause(error);
                }
            }
        } catch (IOException e) {
            error.addSuppressed(e);
        }
        return error;
    }
}
