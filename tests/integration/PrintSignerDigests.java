import android.content.pm.Signature;
import android.content.pm.SigningInfo;
import apktoolkit.SignerDigests;
import com.android.apksig.ApkVerifier;
import java.io.File;
import java.security.cert.X509Certificate;
import java.util.List;

/**
 * PrintSignerDigests LEVEL FILE [JAR-SIGNER]: finds the signers of the package FILE as the package
 * manager of API level LEVEL does, and prints the digests that SignerDigests returns for them. If
 * the digest JAR-SIGNER is given, instead prints "true" if JAR-SIGNER is one of these digests, else
 * "false". Fails if the package manager would refuse the package.
 */
public final class PrintSignerDigests {
    public static void main(String[] words) throws Exception {
        int level = Integer.parseInt(words[0]);
        ApkVerifier.Result result =
                new ApkVerifier.Builder(new File(words[1]))
                        .setMinCheckedPlatformVersion(level)
                        .setMaxCheckedPlatformVersion(level)
                        .build()
                        .verify();
        if (!result.isVerified()) {
            System.err.println(result.getErrors());
            System.exit(1);
        }
        List<X509Certificate> certificates = result.getSignerCertificates();
        Signature[] signers = new Signature[certificates.size()];
        for (int i = 0; i < signers.length; ++i) {
            signers[i] = new Signature(certificates.get(i).getEncoded());
        }
        String digests =
                level < 28 ? SignerDigests.of(signers) : SignerDigests.of(new SigningInfo(signers));
        System.out.println(words.length < 3 ? digests : SignerDigests.isAmong(digests, words[2]));
    }
}
