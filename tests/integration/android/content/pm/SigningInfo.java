package android.content.pm;

/** The part of the platform's class that SignerDigests uses. */
public final class SigningInfo {
    private final Signature[] signers;

    public SigningInfo(Signature[] signers) {
        this.signers = signers.clone();
    }

    public Signature[] getApkContentsSigners() {
        return signers.clone();
    }
}
