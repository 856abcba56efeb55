// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertSame;

import java.io.File;
import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import org.junit.Rule;
import org.junit.Test;
import org.junit.rules.TemporaryFolder;

/** What a failure to load the native library says. */
public final class NativeLibraryTest {
    private static final String SENTENCE =
            "libjni_kyface_api.so for x86_64 needs a processor with AVX2 and FMA, which this one is not";

    @Rule public final TemporaryFolder folder = new TemporaryFolder();

    private final UnsatisfiedLinkError error = new UnsatisfiedLinkError("JNI_ERR returned from JNI_OnLoad");

    /**
     * Prints what loading the library comes to: "loaded", or the error's message. Run on an emulated processor.
     *
     * @param arguments none
     */
    public static void main(String[] arguments) {
        String message = "loaded";
        try {
            FaceLibrary.setDebug(false);
        } catch (UnsatisfiedLinkError e) {
            message = e.getMessage();
        }
        System.out.println(message);
    }

    private File processors(String flags) throws IOException {
        File file = folder.newFile();
        String text = "processor\t: 0\nvendor_id\t: GenuineIntel\nflags\t\t: " + flags + "\nbogomips\t: 1\n\nprocessor\t: 1\n";
        Files.write(file.toPath(), text.getBytes(StandardCharsets.UTF_8));
        return file;
    }

    @Test
    public void aProcessorThatLacksInstructionsIsTheReason() throws IOException {
        for (String flags : new String[] {"fpu sse4_2 avx", "fpu avx2 bmi2", "fma avx2x", ""}) {
            UnsatisfiedLinkError explained = NativeLibrary.explained(error, "x86_64", processors(flags));
            assertEquals(flags, SENTENCE, explained.getMessage());
            assertSame(error, explained.getCause());
        }
    }

    @Test
    public void otherReasonsStay() throws IOException {
        assertSame(error, NativeLibrary.explained(error, "amd64", processors("fpu fma avx avx2")));
        assertSame(error, NativeLibrary.explained(error, "aarch64", processors("fpu")));
        assertSame(error, NativeLibrary.explained(error, "x86_64", new File(folder.getRoot(), "none")));
        assertSame(error, NativeLibrary.explained(error, "x86_64", folder.newFile()));
        UnsatisfiedLinkError said = new UnsatisfiedLinkError(SENTENCE);
        assertSame(said, NativeLibrary.explained(said, "x86_64", processors("fpu")));
    }
}
