/** Android's microphone, network state, proximity sensor and log for the native library. */
@NullMarked
package korvel.core;

import org.jspecify.annotations.NullMarked;
