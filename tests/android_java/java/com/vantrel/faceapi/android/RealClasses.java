// SPDX-FileCopyrightText: the libjni_kyface_api authors
// SPDX-License-Identifier: Apache-2.0

package com.vantrel.faceapi.android;

import java.lang.reflect.Field;
import java.lang.reflect.Method;
import java.util.Map;
import org.junit.runners.model.FrameworkMethod;
import org.junit.runners.model.InitializationError;
import org.robolectric.DefaultTestLifecycle;
import org.robolectric.RobolectricTestRunner;
import org.robolectric.config.ConfigurationRegistry;
import org.robolectric.internal.TestEnvironment;
import org.robolectric.internal.bytecode.Sandbox;
import org.robolectric.manifest.AndroidManifest;
import org.robolectric.pluginapi.config.ConfigurationStrategy.Configuration;

/**
 * Runs tests on Android's own classes, without the app that Robolectric makes around every test: that would take
 * classes which come from elsewhere, and is of no use for graphics.
 */
public final class RealClasses extends RobolectricTestRunner {
    private static final class NoApp implements TestEnvironment {
        @Override
        public void setUpApplicationState(String name, Configuration configuration, AndroidManifest manifest) {}

        @Override
        public void tearDownApplication() {}

        @Override
        public void checkStateAfterTestFailure(Throwable failure) throws Throwable {
            throw failure;
        }

        @Override
        public void resetState() {}
    }

    public RealClasses(Class<?> tests) throws InitializationError {
        super(tests);
    }

    @Override
    protected void beforeTest(Sandbox sandbox, FrameworkMethod method, Method inSandbox) throws Throwable {
        for (Method setter : method.getClass().getDeclaredMethods()) {
            if (setter.getName().equals("setStuff")) {
                setter.setAccessible(true);
                setter.invoke(method, sandbox, new NoApp());
            }
        }
        Field lifecycle = method.getClass().getDeclaredField("testLifecycle");
        lifecycle.setAccessible(true);
        lifecycle.set(method,
                sandbox.bootstrappedClass(DefaultTestLifecycle.class).getDeclaredConstructor().newInstance());
        Method getter = method.getClass().getDeclaredMethod("getConfiguration");
        getter.setAccessible(true);
        Map<Class<?>, Object> configuration = ((Configuration) getter.invoke(method)).map();
        Class<?> registry = sandbox.bootstrappedClass(ConfigurationRegistry.class);
        registry.getField("instance").set(null, registry.getConstructor(Map.class).newInstance(configuration));
    }

    @Override
    protected void afterTest(FrameworkMethod method, Method inSandbox) {}

    @Override
    protected void finallyAfterTest(FrameworkMethod method) {}
}
