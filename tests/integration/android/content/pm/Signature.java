package android.content.pm;

/** The part of the platform's class that SignerDigests uses. */
public class Signature {
    private final byte[] certificate;

    public Signature(byte[] certificate) {
        this.certificate = certificate.clone();
    }

    public byte[] toByteArray() {
        return certificate.clone();
    }
}
