package apktoolkit;

import android.content.pm.Signature;
import android.content.pm.SigningInfo;
import java.io.ByteArrayInputStream;
import java.math.BigInteger;
import java.security.MessageDigest;
import java.security.NoSuchAlgorithmException;
import java.security.PublicKey;
import java.security.cert.CertificateException;
import java.security.cert.CertificateFactory;
import java.security.interfaces.RSAPublicKey;
import java.util.Arrays;
import java.util.LinkedHashSet;
import java.util.Set;

/**
 * The package manager's side of binding the signers: names a package's signers in the form in which
 * apktoolkit names a signer to the kernel. Use it in the process that installs.
 *
 * <p>The package manager uses the newest signing block that it knows, apktoolkit the JAR signature.
 * Pass a package to apktoolkit only if its JAR signer is one of these signers: run apktoolkit-bound,
 * or call {@link #isAmong}.
 */
public final class SignerDigests {
    private SignerDigests() {}

    /**
     * The signers of an installed package from API level 28 on
     * ({@code PackageManager.GET_SIGNING_CERTIFICATES}): those of its present content. If the key was
     * rotated, earlier keys are left out on purpose. A retired key may be in other hands, and a
     * payload names the key and not the package.
     */
    public static String of(SigningInfo info) throws CertificateException {
        return of(info.getApkContentsSigners());
    }

    /**
     * The same for API level 27 ({@code PackageInfo.signatures}, {@code PackageManager.GET_SIGNATURES}).
     *
     * @return the SHA-256 digest of each signer's RSA modulus, in lower-case hexadecimal, with commas
     *     between. Keys of other kinds have no digest: apktoolkit does not accept their signatures.
     *     Empty if no signer has an RSA key.
     */
    public static String of(Signature[] signers) throws CertificateException {
        CertificateFactory factory = CertificateFactory.getInstance("X.509");
        Set<String> digests = new LinkedHashSet<>();
        for (Signature signer : signers) {
            PublicKey key =
                    factory.generateCertificate(new ByteArrayInputStream(signer.toByteArray()))
                            .getPublicKey();
            if (key instanceof RSAPublicKey) {
                digests.add(digestOf(((RSAPublicKey) key).getModulus()));
            }
        }
        return String.join(",", digests);
    }

    /** True if the JAR signer is one of the signers; {@code digests} is the result of {@link #of}. */
    public static boolean isAmong(String digests, String jarSigner) {
        return !jarSigner.isEmpty() && Arrays.asList(digests.split(",")).contains(jarSigner);
    }

    /** The digest as in a payload: of the modulus's bytes, highest first, without leading zeros. */
    private static String digestOf(BigInteger modulus) {
        byte[] bytes = modulus.toByteArray();
        int sign = bytes[0] == 0 ? 1 : 0;
        try {
            MessageDigest sha256 = MessageDigest.getInstance("SHA-256");
            sha256.update(bytes, sign, bytes.length - sign);
            return String.format("%064x", new BigInteger(1, sha256.digest()));
        } catch (NoSuchAlgorithmException e) {
            throw new AssertionError("every Android has SHA-256", e);
        }
    }
}
