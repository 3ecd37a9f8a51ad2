package android.content.pm;

/** Replaces the platform's class in tests. Has only what SignerDigests and its test use. */
public final class SigningInfo {
    private final Signature[] signers;

    public SigningInfo(Signature[] signers) {
        this.signers = signers.clone();
    }

    public Signature[] getApkContentsSigners() {
        return signers.clone();
    }
}
