package korvel.core;

import static org.robolectric.Shadows.shadowOf;

import android.content.Context;
import android.content.ContextWrapper;
import android.net.ConnectivityManager;
import android.net.Network;
import java.util.ArrayList;
import java.util.HashSet;
import java.util.List;
import java.util.Set;
import java.util.concurrent.ExecutorService;
import java.util.concurrent.Executors;
import java.util.concurrent.Future;
import java.util.concurrent.TimeUnit;
import korvel.talvox.SpeechError;
import korvel.talvox.TalvoxEngine;
import korvel.talvox.TalvoxRecognizer;
import korvel.talvox.TalvoxSettings;
import korvel.talvox.support.Connectivity;
import korvel.talvox.support.EngineTestCase;
import korvel.talvox.support.Events;
import org.junit.After;
import org.junit.Assert;
import org.junit.Before;
import org.junit.Test;

/** What Android says about the network reaches the engine. */
public class ReachabilityTest extends EngineTestCase {
    @Before
    public void listen() {
        CoreApplication.install(application);
        useGateway("http://127.0.0.1:9/");
    }

    @After
    public void returnToTheNetwork() {
        Connectivity.wifi(application);
    }

    private SpeechError recognize() throws InterruptedException {
        final Events events = new Events();
        try (TalvoxRecognizer recognizer =
                engine.createRecognizer(TalvoxSettings.builder().build(), events)) {
            recognizer.start();
            recognizer.cancel();
            events.end();
        }
        return events.getError();
    }

    @Test
    public void withoutANetworkNoRecognitionStarts() throws Exception {
        Connectivity.mobile(application);
        Assert.assertEquals(SpeechError.CANCELED, recognize());
        final ConnectivityManager manager =
                application.getSystemService(ConnectivityManager.class);
        final Network network = manager.getActiveNetwork();
        for (ConnectivityManager.NetworkCallback callback :
                new ArrayList<>(shadowOf(manager).getNetworkCallbacks())) {
            callback.onLost(network);
        }
        Assert.assertEquals(SpeechError.NETWORK, recognize());
        assertLogged("reachability 0; failing");
        Connectivity.wifi(application);
        Assert.assertEquals(SpeechError.CANCELED, recognize());
    }

    @Test
    public void theStateAtTheStartIsThatOfTheActiveNetwork() throws Exception {
        final ConnectivityManager manager =
                application.getSystemService(ConnectivityManager.class);
        shadowOf(manager).setDefaultNetworkActive(false);
        shadowOf(manager).setActiveNetworkInfo(null);
        CoreApplication.install(anotherApplication());
        Assert.assertEquals(SpeechError.NETWORK, recognize());
    }

    /** Another application with the same services. */
    private Context anotherApplication() {
        return new ContextWrapper(application) {
            @Override
            public Context getApplicationContext() {
                return this;
            }
        };
    }

    private Set<ConnectivityManager.NetworkCallback> watchers() {
        final ConnectivityManager manager =
                application.getSystemService(ConnectivityManager.class);
        return new HashSet<>(shadowOf(manager).getNetworkCallbacks());
    }

    @Test
    public void oneWatcherIsRegisteredHoweverManyAskForTheEngine() throws Exception {
        final Set<ConnectivityManager.NetworkCallback> before = watchers();
        Assert.assertEquals(1, before.size());
        final Context early =
                new ContextWrapper(application) {
                    @Override
                    public Context getApplicationContext() {
                        return null; // as before the application is there
                    }
                };
        final Context[] contexts = {application, new ContextWrapper(application), early};
        final int threads = 16;
        final ExecutorService pool = Executors.newFixedThreadPool(threads);
        final List<Future<TalvoxEngine>> engines = new ArrayList<>();
        for (int i = 0; i < 10 * threads; i++) {
            final Context context = contexts[i % contexts.length];
            engines.add(pool.submit(() -> TalvoxEngine.getInstance(context)));
        }
        for (Future<TalvoxEngine> one : engines) {
            Assert.assertSame(engine, one.get(PATIENCE_S, TimeUnit.SECONDS));
        }
        pool.shutdown();
        Assert.assertEquals(before, watchers());
    }

    @Test
    public void theWatcherMovesToAnotherApplication() {
        final Set<ConnectivityManager.NetworkCallback> before = watchers();
        CoreApplication.install(anotherApplication());
        final Set<ConnectivityManager.NetworkCallback> after = watchers();
        Assert.assertEquals(1, after.size());
        Assert.assertNotEquals(before, after);
    }
}
