// Signs and verifies assertions with javax.xml.crypto, the XML signatures of the JDK.
//
//   java JdkSigner.java sign KEY CERTIFICATE METHOD < unsigned > signed
//   java JdkSigner.java verify CERTIFICATE < signed
//
// KEY is a PKCS#8 key in DER, CERTIFICATE a certificate in PEM or DER.

import java.io.FileInputStream;
import java.nio.file.Files;
import java.nio.file.Path;
import java.security.KeyFactory;
import java.security.PrivateKey;
import java.security.cert.CertificateFactory;
import java.security.cert.X509Certificate;
import java.security.spec.PKCS8EncodedKeySpec;
import java.util.List;
import javax.xml.crypto.dsig.CanonicalizationMethod;
import javax.xml.crypto.dsig.DigestMethod;
import javax.xml.crypto.dsig.Reference;
import javax.xml.crypto.dsig.SignedInfo;
import javax.xml.crypto.dsig.Transform;
import javax.xml.crypto.dsig.XMLSignature;
import javax.xml.crypto.dsig.XMLSignatureFactory;
import javax.xml.crypto.dsig.dom.DOMSignContext;
import javax.xml.crypto.dsig.dom.DOMValidateContext;
import javax.xml.crypto.dsig.keyinfo.KeyInfo;
import javax.xml.crypto.dsig.keyinfo.KeyInfoFactory;
import javax.xml.crypto.dsig.spec.C14NMethodParameterSpec;
import javax.xml.crypto.dsig.spec.TransformParameterSpec;
import javax.xml.parsers.DocumentBuilderFactory;
import javax.xml.transform.OutputKeys;
import javax.xml.transform.Transformer;
import javax.xml.transform.TransformerFactory;
import javax.xml.transform.dom.DOMSource;
import javax.xml.transform.stream.StreamResult;
import org.w3c.dom.Document;
import org.w3c.dom.Element;

public final class JdkSigner {
  private static final String SAML = "urn:oasis:names:tc:SAML:2.0:assertion";

  public static void main(String[] arguments) throws Exception {
    DocumentBuilderFactory builders = DocumentBuilderFactory.newInstance();
    builders.setNamespaceAware(true);
    Document document = builders.newDocumentBuilder().parse(System.in);
    document.getDocumentElement().setIdAttribute("ID", true);
    if (arguments[0].equals("sign")) {
      sign(document, Path.of(arguments[1]), certificate(arguments[2]), arguments[3]);
      write(document);
    } else if (!verifies(document, certificate(arguments[1]))) {
      System.err.println("The signature is not valid.");
      System.exit(1);
    }
  }

  private static X509Certificate certificate(String file) throws Exception {
    try (FileInputStream input = new FileInputStream(file)) {
      return (X509Certificate) CertificateFactory.getInstance("X.509").generateCertificate(input);
    }
  }

  private static PrivateKey key(Path file, String algorithm) throws Exception {
    return KeyFactory.getInstance(algorithm)
        .generatePrivate(new PKCS8EncodedKeySpec(Files.readAllBytes(file)));
  }

  private static void sign(Document document, Path keyFile, X509Certificate certificate,
                           String method) throws Exception {
    Element assertion = document.getDocumentElement();
    XMLSignatureFactory factory = XMLSignatureFactory.getInstance("DOM");
    Reference reference = factory.newReference(
        "#" + assertion.getAttribute("ID"), factory.newDigestMethod(DigestMethod.SHA256, null),
        List.of(factory.newTransform(Transform.ENVELOPED, (TransformParameterSpec) null),
                factory.newTransform(CanonicalizationMethod.EXCLUSIVE,
                                     (TransformParameterSpec) null)),
        null, null);
    SignedInfo signedInfo = factory.newSignedInfo(
        factory.newCanonicalizationMethod(CanonicalizationMethod.EXCLUSIVE,
                                          (C14NMethodParameterSpec) null),
        factory.newSignatureMethod(method, null), List.of(reference));
    KeyInfoFactory keyInfos = factory.getKeyInfoFactory();
    KeyInfo keyInfo = keyInfos.newKeyInfo(List.of(keyInfos.newX509Data(List.of(certificate))));
    PrivateKey key = key(keyFile, certificate.getPublicKey().getAlgorithm());
    Element subject = (Element) document.getElementsByTagNameNS(SAML, "Subject").item(0);
    DOMSignContext context = new DOMSignContext(key, assertion, subject);
    context.setDefaultNamespacePrefix("ds");
    factory.newXMLSignature(signedInfo, keyInfo).sign(context);
  }

  private static boolean verifies(Document document, X509Certificate certificate)
      throws Exception {
    DOMValidateContext context = new DOMValidateContext(
        certificate.getPublicKey(),
        document.getElementsByTagNameNS(XMLSignature.XMLNS, "Signature").item(0));
    return XMLSignatureFactory.getInstance("DOM").unmarshalXMLSignature(context).validate(context);
  }

  private static void write(Document document) throws Exception {
    Transformer writer = TransformerFactory.newInstance().newTransformer();
    writer.setOutputProperty(OutputKeys.OMIT_XML_DECLARATION, "yes");
    writer.transform(new DOMSource(document), new StreamResult(System.out));
  }
}
