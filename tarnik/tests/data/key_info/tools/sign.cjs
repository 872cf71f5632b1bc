// node sign.cjs TEMPLATE KEY SIGNER.pem NAMED.pem HINT OUTPUT: signs with xml-crypto and a KeyInfo that names NAMED.
const { X509Certificate, createHash } = require('node:crypto');
const { readFileSync, writeFileSync } = require('node:fs');
const { createRequire } = require('node:module');
// The package is installed in the working directory.
const { SignedXml } = createRequire(process.cwd() + '/')('xml-crypto');

const [template, key, signer, named, hint, output] = process.argv.slice(2);
const exclusive = 'http://www.w3.org/2001/10/xml-exc-c14n#';
const certificate = new X509Certificate(readFileSync(named));
const base64 = (value) => Buffer.from(value, 'base64url').toString('base64');
const ds11 = 'xmlns:dsig11="http://www.w3.org/2009/xmldsig11#"';

const hints = {
  'key-value': () => {
    const { n, e } = certificate.publicKey.export({ format: 'jwk' });
    return `<ds:KeyValue><ds:RSAKeyValue><ds:Modulus>${base64(n)}</ds:Modulus>` +
      `<ds:Exponent>${base64(e)}</ds:Exponent></ds:RSAKeyValue></ds:KeyValue>`;
  },
  'der-encoded-key-value': () => {
    const der = certificate.publicKey.export({ type: 'spki', format: 'der' });
    return `<dsig11:DEREncodedKeyValue ${ds11}>${der.toString('base64')}</dsig11:DEREncodedKeyValue>`;
  },
  'x509-digest': () => {
    const digest = createHash('sha512').update(certificate.raw).digest('base64');
    return `<ds:X509Data><dsig11:X509Digest ${ds11} Algorithm="http://www.w3.org/2001/04/xmlenc#sha512">` +
      `${digest}</dsig11:X509Digest></ds:X509Data>`;
  },
  'key-name': () => '<ds:KeyName>key of the sts</ds:KeyName>',
  none: () => null,
};

const signature = new SignedXml({
  privateKey: readFileSync(key),
  publicCert: readFileSync(signer),
  signatureAlgorithm: 'http://www.w3.org/2001/04/xmldsig-more#rsa-sha256',
  canonicalizationAlgorithm: exclusive,
  getKeyInfoContent: hints[hint],
});
signature.addReference({
  xpath: "//*[local-name(.)='Assertion']",
  transforms: ['http://www.w3.org/2000/09/xmldsig#enveloped-signature', exclusive],
  digestAlgorithm: 'http://www.w3.org/2001/04/xmlenc#sha256',
});
signature.computeSignature(readFileSync(template, 'utf8'), {
  prefix: 'ds',
  location: { reference: "//*[local-name(.)='Issuer']", action: 'after' },
});
writeFileSync(output, signature.getSignedXml());
