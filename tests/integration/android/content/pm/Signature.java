package android.content.pm;

/** Replaces the platform's class in tests. Has only what SignerDigests and its test use. */
public class Signature {
    private final byte[] certificate;

    public Signature(byte[] certificate) {
        this.certificate = certificate.clone();
    }

    public byte[] toByteArray() {
        return certificate.clone();
    }
}
