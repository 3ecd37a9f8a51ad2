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
 * Lists the current RSA signers of a package, as the package manager knows them. Each signer is
 * shown as the SHA-256 digest of the key's modulus. For the JAR signer's key, apktoolkit computes
 * the digest in the same way and passes it to the kernel. Use this class in the process that
 * installs packages.
 *
 * <p>Of a package's signature schemes, the package manager uses the newest one that it knows.
 * apktoolkit uses the JAR signature, whose signer can be a different one. Pass a package to
 * apktoolkit only if its JAR signer is one of the package manager's signers. To check this, run
 * apktoolkit-bound, or call {@link #isAmong}.
 */
public final class SignerDigests {
    private SignerDigests() {}

    /**
     * Returns the digests of the current signers of an installed package. Needs API level 28 or
     * later ({@code PackageManager.GET_SIGNING_CERTIFICATES}). If the key was rotated, the result
     * leaves out the earlier keys on purpose, because an attacker may have an earlier key. If the
     * result had the earlier keys, the caller would also pass the owner's packages with a JAR
     * signature of an earlier key to apktoolkit. The kernel gets only the digest of a key, not the
     * name of the package. It would therefore get the same digest for the owner's packages and for
     * the attacker's packages.
     */
    public static String of(SigningInfo info) throws CertificateException {
        return of(info.getApkContentsSigners());
    }

    /**
     * Returns the digests of the signers in {@code PackageInfo.signatures}, for API level 27
     * ({@code PackageManager.GET_SIGNATURES}).
     *
     * @return the SHA-256 digest of each signer's RSA modulus, in lower-case hexadecimal, separated
     *     by commas. Other kinds of key are left out, because apktoolkit does not accept their
     *     signatures. The text is empty if no signer has an RSA key.
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

    /**
     * Returns true if {@code digests}, a result of {@link #of}, contains {@code jarSigner}, the
     * digest of the JAR signer's key.
     */
    public static boolean isAmong(String digests, String jarSigner) {
        return !jarSigner.isEmpty() && Arrays.asList(digests.split(",")).contains(jarSigner);
    }

    /** Returns the SHA-256 digest of the modulus's bytes, high byte first, without leading zeros. */
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
