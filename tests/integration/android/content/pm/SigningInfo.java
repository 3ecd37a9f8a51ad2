package android.content.pm;

/** As much of the platform's class as SignerDigests uses. */
public final class SigningInfo {
    private final Signature[] signers;

    public SigningInfo(Signature[] signers) {
        this.signers = signers.clone();
    }

    public Signature[] getApkContentsSigners() {
        return signers.clone();
    }
}
