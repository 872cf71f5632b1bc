// Signs assertions with xml-crypto (npm).
//
//   node xml_crypto_signer.js KEY CERTIFICATE PREFIXES < unsigned > signed
//
// KEY and CERTIFICATE are in PEM. PREFIXES is the prefix list of the reference, or "" for none.
'use strict';

const fs = require('fs');
const { SignedXml } = require('xml-crypto');

const [key, certificate, prefixes] = process.argv.slice(2);
const exclusive = 'http://www.w3.org/2001/10/xml-exc-c14n#';

const signer = new SignedXml({
  privateKey: fs.readFileSync(key),
  publicCert: fs.readFileSync(certificate),
  signatureAlgorithm: 'http://www.w3.org/2001/04/xmldsig-more#rsa-sha256',
  canonicalizationAlgorithm: exclusive,
});
signer.addReference({
  xpath: '/*',
  digestAlgorithm: 'http://www.w3.org/2001/04/xmlenc#sha256',
  transforms: ['http://www.w3.org/2000/09/xmldsig#enveloped-signature', exclusive],
  inclusiveNamespacesPrefixList: prefixes === '' ? [] : prefixes.split(' '),
});
signer.computeSignature(fs.readFileSync(0, 'utf8'), {
  prefix: 'ds',
  location: { reference: "/*/*[local-name(.)='Issuer']", action: 'after' },
});
process.stdout.write(signer.getSignedXml());
