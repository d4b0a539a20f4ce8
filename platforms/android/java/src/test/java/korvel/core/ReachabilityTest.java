package korvel.core;

import static org.robolectric.Shadows.shadowOf;

import android.net.ConnectivityManager;
import android.net.Network;
import java.util.ArrayList;
import korvel.talvox.SpeechError;
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
        CoreApplication.install(application);
        Assert.assertEquals(SpeechError.NETWORK, recognize());
    }

    @Test
    public void oneWatcherIsLeftHoweverOftenItBegins() {
        final ConnectivityManager manager =
                application.getSystemService(ConnectivityManager.class);
        CoreApplication.install(application);
        CoreApplication.install(application);
        Assert.assertEquals(1, shadowOf(manager).getNetworkCallbacks().size());
    }
}
