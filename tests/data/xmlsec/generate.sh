#!/usr/bin/env bash
# Regenerates the signed vectors of this folder with the xmlsec1 command-line tool, an
# implementation independent of ours. Each negative vector differs from a valid one by the single
# defect its name says. The keys come from ../keys (see its README.md).
set -euo pipefail
cd "$(dirname "$0")"
keys=../keys
assertion="urn:oasis:names:tc:SAML:2.0:assertion:Assertion"
subject="urn:oasis:names:tc:SAML:2.0:assertion:Subject"

# sign TEMPLATE OUTPUT KEY [CERT] [more xmlsec1 options]: signs with the key (and puts CERT in
# ds:X509Data when the template has one).
sign() {
  local template=$1 output=$2 key=$3 cert=${4:-}
  shift 4 || shift $#
  local keyspec="$keys/$key.key"
  [ -n "$cert" ] && keyspec="$keyspec,$keys/$cert.pem"
  xmlsec1 --sign --privkey-pem "$keyspec" --id-attr:ID "$assertion" --id-attr:ID "$subject" "$@" \
    --output "$output" "templates/$template" 2>/dev/null
}

# edit INPUT OUTPUT PYTHON-EXPRESSION: applies a text edit (on `text`) to a signed vector.
edit() {
  python3 - "$1" "$2" "$3" <<'PY'
import re, sys
source, target, expression = sys.argv[1:4]
text = open(source, encoding="utf-8").read()
edited = eval(expression, {"re": re, "text": text})
assert edited != text, "the edit changed nothing"
open(target, "w", encoding="utf-8").write(edited)
PY
}

# ---- valid signatures
sign assertion-rsa.xml assertion-rsa.xml sts sts
sign assertion-ec.xml assertion-ec.xml sts-ec sts-ec
sign assertion-inclusive.xml assertion-inclusive.xml sts sts
sign assertion-without-keyinfo.xml assertion-without-keyinfo.xml sts ""
sign assertion-empty-uri.xml assertion-empty-uri.xml sts sts
sign soap-embedded-exclusive.xml soap-embedded-exclusive.xml sts sts
sign soap-embedded-inclusive.xml soap-embedded-inclusive.xml sts sts

# ---- signers that are not trusted (or only when listed themselves)
sign assertion-rsa.xml untrusted-signer.xml untrusted untrusted
sign assertion-rsa.xml expired-signer.xml expired-sts expired-sts
# The attacker signs with his own key and offers it as ds:KeyValue.
sign keyvalue.xml keyvalue-attacker-key.xml untrusted ""

# ---- refused algorithms and constructs, each signed by the trusted signer
sign rsa-sha1.xml rsa-sha1.xml sts sts
printf 'an HMAC key of 32 bytes, shared!' > hmac.key
xmlsec1 --sign --hmackey hmac.key --id-attr:ID "$assertion" --output hmac-sha256.xml templates/hmac-sha256.xml 2>/dev/null
rm -f hmac.key
sign xpath-transform.xml xpath-transform.xml sts sts
sign object.xml object.xml sts sts
sign too-many-references.xml too-many-references.xml sts sts
sign too-many-transforms.xml too-many-transforms.xml sts sts
sign reference-other-id.xml reference-other-id.xml sts sts

# ---- edits of a valid signature
edit assertion-rsa.xml tampered-digest.xml \
  "re.sub(r'<ds:DigestValue>(.)', lambda m: '<ds:DigestValue>' + ('A' if m.group(1) != 'A' else 'B'), text, count=1)"
edit assertion-rsa.xml tampered-signature-value.xml \
  "re.sub(r'<ds:SignatureValue>(.)', lambda m: '<ds:SignatureValue>' + ('A' if m.group(1) != 'A' else 'B'), text, count=1)"
edit assertion-rsa.xml signature-value-not-base64.xml "text.replace('<ds:SignatureValue>', '<ds:SignatureValue>*')"
edit assertion-rsa.xml digest-value-not-base64.xml "text.replace('<ds:DigestValue>', '<ds:DigestValue>*')"
edit assertion-ec.xml ec-signature-value-truncated.xml \
  "re.sub(r'<ds:SignatureValue>[^<]*', '<ds:SignatureValue>AAAA', text)"
edit assertion-rsa.xml transform-after-canonicalization.xml \
  "text.replace('<ds:Transform Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>', '<ds:Transform Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/><ds:Transform Algorithm=\"http://www.w3.org/2000/09/xmldsig#enveloped-signature\"/>', 1)"
edit assertion-rsa.xml tampered-content.xml "text.replace('user@example.com', 'admin@example.com')"
edit assertion-rsa.xml md5-digest.xml \
  "text.replace('http://www.w3.org/2001/04/xmlenc#sha256', 'http://www.w3.org/2001/04/xmldsig-more#md5')"
edit assertion-rsa.xml reference-uri-http.xml "text.replace('URI=\"#_a1\"', 'URI=\"http://127.0.0.1:PORT/\"')"
edit assertion-rsa.xml reference-uri-file.xml "text.replace('URI=\"#_a1\"', 'URI=\"file:///etc/hostname\"')"
edit assertion-rsa.xml retrieval-method.xml \
  "text.replace('<ds:KeyInfo>', '<ds:KeyInfo><ds:RetrievalMethod URI=\"#_s1\"/>')"
cert_of() { sed -n '/BEGIN CERTIFICATE/,/END CERTIFICATE/p' "$keys/$1.pem" | grep -v CERTIFICATE | tr -d '\n'; }
edit assertion-rsa.xml certificate-swapped.xml \
  "re.sub(r'<ds:X509Certificate>[^<]*', '<ds:X509Certificate>$(cert_of client)', text)"
# Wrapping: a forged assertion with the same ID carries the genuine signature, and the genuine
# assertion hides in its advice.
python3 - <<'PY'
import re
genuine = open("assertion-rsa.xml", encoding="utf-8").read()
body = genuine.split("?>", 1)[1].strip()
signature = re.search(r"<ds:Signature.*?</ds:Signature>", body, re.S).group(0)
hidden = body.replace(signature, "").replace(' xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion"', "")
forged = ('<?xml version="1.0" encoding="UTF-8"?>\n'
          '<saml2:Assertion xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion" ID="_a1" '
          'IssueInstant="2024-01-01T12:00:00.000Z" Version="2.0">\n'
          '  <saml2:Issuer>https://sts.example/sts</saml2:Issuer>\n  ' + signature + '\n'
          '  <saml2:Subject><saml2:NameID>attacker@example.com</saml2:NameID></saml2:Subject>\n'
          '  <saml2:Advice>' + hidden + '</saml2:Advice>\n'
          '</saml2:Assertion>\n')
open("duplicate-id-wrapping.xml", "w", encoding="utf-8").write(forged)
PY

echo "Regenerated the signed vectors in $(pwd)"
