package bare;

/** Loads the library and does nothing with it. */
public final class Loader {
    private Loader() {}

    public static void main(String[] arguments) {
        System.loadLibrary("KorvelTalvox");
        System.out.println("loaded");
    }
}
