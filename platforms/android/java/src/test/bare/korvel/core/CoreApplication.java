package korvel.core;

import android.content.Context;
import android.content.ContextWrapper;

/** What native code needs of an application at least. */
public final class CoreApplication {
    private CoreApplication() {}

    static Context getApplicationContext() {
        return new ContextWrapper(null);
    }
}
