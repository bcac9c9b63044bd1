#!/usr/bin/env bash
# Regenerates the token vectors of this folder (see README.md):
#  - the tokens issued by the project's token issuer and their negative twins, written by the
#    generate_test_tokens program (tools/token-issuer);
#  - tokens signed by the xmlsec1 command-line tool from the same keys, an independent signer,
#    and the algorithm and reference variants that only it can sign.
# Usage: generate.sh [BUILD_DIR]   (default: build; the program is built there first, unless
#        GENERATE_TEST_TOKENS names an already built generate_test_tokens)
set -euo pipefail
here=$(cd "$(dirname "$0")" && pwd)
root=$(cd "$here/../../.." && pwd)
build=${1:-$root/build}
keys=$root/tests/data/keys
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

generator=${GENERATE_TEST_TOKENS:-}
if [ -z "$generator" ]; then
  cmake -S "$root" -B "$build" >/dev/null
  cmake --build "$build" --target generate_test_tokens -j2 >/dev/null
  generator=$build/tools/token-issuer/generate_test_tokens
fi
"$generator" "$keys" "$here"

ds='http://www.w3.org/2000/09/xmldsig#'
exc='http://www.w3.org/2001/10/xml-exc-c14n#'
enveloped='http://www.w3.org/2000/09/xmldsig#enveloped-signature'
rsa_sha256='http://www.w3.org/2001/04/xmldsig-more#rsa-sha256'
sha256='http://www.w3.org/2001/04/xmlenc#sha256'
prefixes='<ec:InclusiveNamespaces xmlns:ec="http://www.w3.org/2001/10/xml-exc-c14n#" PrefixList="xs"/>'

# signature_template URI SIGNATURE_METHOD DIGEST_METHOD TRANSFORMS KEY_INFO [OBJECT]
signature_template() {
  printf '<ds:Signature xmlns:ds="%s"><ds:SignedInfo><ds:CanonicalizationMethod Algorithm="%s"/>' "$ds" "$exc"
  printf '<ds:SignatureMethod Algorithm="%s"/><ds:Reference URI="%s"><ds:Transforms>%s</ds:Transforms>' "$2" "$1" "$4"
  printf '<ds:DigestMethod Algorithm="%s"/><ds:DigestValue/></ds:Reference></ds:SignedInfo>' "$3"
  printf '<ds:SignatureValue/>%s%s</ds:Signature>' "$5" "${6:-}"
}

standard_transforms="<ds:Transform Algorithm=\"$enveloped\"/><ds:Transform Algorithm=\"$exc\"/>"
hok_transforms="<ds:Transform Algorithm=\"$enveloped\"/><ds:Transform Algorithm=\"$exc\">$prefixes</ds:Transform>"
x509='<ds:KeyInfo><ds:X509Data><ds:X509Certificate/></ds:X509Data></ds:KeyInfo>'
keyvalue='<ds:KeyInfo><ds:KeyValue/></ds:KeyInfo>'

# sign NAME TEMPLATE SIGNATURE KEY_OPTIONS...: fills SIGNATURE into TEMPLATE and signs it.
sign() {
  local name=$1 template=$2 signature=$3
  shift 3
  local signature_file="$work/$name.sig"
  printf '%s' "$signature" > "$signature_file"
  # The signature goes where @SIGNATURE@ stands (right after Issuer).
  awk -v sigfile="$signature_file" 'BEGIN { getline sig < sigfile } { gsub(/@SIGNATURE@/, sig); print }' \
    "$here/$template" | head -c -1 > "$work/$name.in"
  xmlsec1 --sign --id-attr:ID urn:oasis:names:tc:SAML:2.0:assertion:Assertion \
    --id-attr:ID urn:oasis:names:tc:SAML:2.0:assertion:Audience "$@" --output "$work/$name" "$work/$name.in" 2>/dev/null
  # xmlsec1 writes an XML declaration; the tokens are kept without it, as an STS hands them out.
  sed '1{/^<?xml/d}' "$work/$name" | head -c -1 > "$here/$name"
}

bearer=unsigned-bearer.xml.in
hok=unsigned-holder-of-key.xml.in

# Accepted: an independent signer, RSA and EC.
sign valid-xmlsec1-rsa.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" "$sha256" "$standard_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
sign valid-xmlsec1-holder-of-key.xml $hok \
  "$(signature_template '#_holder-of-key-token' "$rsa_sha256" "$sha256" "$hok_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
sign valid-xmlsec1-ec.xml $bearer \
  "$(signature_template '#_bearer-token' 'http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256' "$sha256" \
     "$standard_transforms" "$x509")" \
  --privkey-pem "$keys/sts-ec.key,$keys/sts-ec.pem"

# Refused although cryptographically sound: weak or keyless algorithms, foreign transforms, extras.
sign signature-rsa-sha1.xml $bearer \
  "$(signature_template '#_bearer-token' "${ds}rsa-sha1" "$sha256" "$standard_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
sign digest-sha1.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" "${ds}sha1" "$standard_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
printf 'a shared secret' > "$work/hmac.key"
sign signature-hmac-sha256.xml $bearer \
  "$(signature_template '#_bearer-token' 'http://www.w3.org/2001/04/xmldsig-more#hmac-sha256' "$sha256" \
     "$standard_transforms" '')" \
  --hmackey "$work/hmac.key"
sign digest-md5.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" 'http://www.w3.org/2001/04/xmldsig-more#md5' \
     "$standard_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
sign transform-xpath.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" "$sha256" \
     "<ds:Transform Algorithm=\"http://www.w3.org/TR/1999/REC-xpath-19991116\"><ds:XPath>not(ancestor-or-self::ds:Signature)</ds:XPath></ds:Transform><ds:Transform Algorithm=\"$exc\"/>" \
     "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
sign signature-with-object.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" "$sha256" "$standard_transforms" "$x509" \
     '<ds:Object Id="payload"><Payload xmlns="urn:example">data</Payload></ds:Object>')" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
# An attacker's key carried in ds:KeyValue, with a signature that matches it.
sign keyvalue-attacker-key.xml $bearer \
  "$(signature_template '#_bearer-token' "$rsa_sha256" "$sha256" "$standard_transforms" "$keyvalue")" \
  --privkey-pem "$keys/untrusted.key"

# A signature by the trusted signer over another element of the token, not the token.
sed 's|<saml2:Audience>https://service.example/one</saml2:Audience>|<saml2:Audience ID="_audience">https://service.example/one</saml2:Audience>|' \
  "$here/$hok" > "$work/audience-id.in"
cp "$work/audience-id.in" "$here/audience-id.xml.in"
sign reference-uri-other-id.xml audience-id.xml.in \
  "$(signature_template '#_audience' "$rsa_sha256" "$sha256" "$hok_transforms" "$x509")" \
  --privkey-pem "$keys/sts.key,$keys/sts.pem"
# The same with the token's ID changed to the referenced one: two elements now carry it.
sed 's|ID="_holder-of-key-token"|ID="_audience"|' "$here/reference-uri-other-id.xml" \
  > "$here/reference-uri-other-id-copied-to-token.xml"

# UTF-7 hides a DOCTYPE from a reader that only looks at ASCII.
{
  printf '<?xml version="1.0" encoding="UTF-7"?>\n'
  { printf '<!DOCTYPE saml2:Assertion [<!ENTITY user "alice@example.com">]>\n'; cat "$here/valid-bearer.xml"; } |
    iconv -f UTF-8 -t UTF-7
} > "$here/utf7-hidden-doctype.xml"

rm -f "$here"/*.xml.in
echo "Regenerated token vectors in $here"
