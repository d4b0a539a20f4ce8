/** What native code calls and is called by. Not for applications. */
@NullMarked
package korvel.talvox.impl;

import org.jspecify.annotations.NullMarked;
