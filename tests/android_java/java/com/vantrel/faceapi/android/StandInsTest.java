// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.android;

import static org.junit.Assert.assertEquals;
import static org.junit.Assert.assertTrue;

import java.io.IOException;
import java.nio.charset.StandardCharsets;
import java.nio.file.Files;
import java.nio.file.Paths;
import java.util.List;
import org.junit.Test;
import org.junit.runner.RunWith;
import org.robolectric.annotation.Config;
import org.robolectric.annotation.GraphicsMode;
import org.robolectric.nativeruntime.DefaultNativeRuntimeLoader;

/** The calls on Android's own classes, its native graphics included, against what the stand-ins answered. */
@RunWith(RealClasses.class)
@Config(sdk = 35, manifest = Config.NONE)
@GraphicsMode(GraphicsMode.Mode.NATIVE)
public final class StandInsTest {
    @Test
    public void standInsBehaveAsTheRealClasses() throws IOException {
        DefaultNativeRuntimeLoader.injectAndLoad();
        List<String> expected =
                Files.readAllLines(Paths.get(System.getProperty("kyface.expected")), StandardCharsets.UTF_8);
        List<String> got = Calls.journal();
        assertTrue("there are calls", got.size() > 10000);
        for (int i = 0; i < Math.min(expected.size(), got.size()); i++) {
            assertEquals("call " + i, got.get(i), expected.get(i));
        }
        assertEquals(got.size(), expected.size());
    }
}
