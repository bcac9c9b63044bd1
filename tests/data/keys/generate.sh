#!/usr/bin/env bash
# Regenerates the test keys and certificates of this folder (see README.md). The CA-issued
# certificates are valid for a century; expired-sts.pem lies wholly in 2001.
set -euo pipefail
cd "$(dirname "$0")"

days=36500
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

rsa_key() { openssl genpkey -algorithm RSA -pkeyopt rsa_keygen_bits:2048 -out "$1" 2>/dev/null; }
ec_key() { openssl genpkey -algorithm EC -pkeyopt ec_paramgen_curve:P-256 -out "$1" 2>/dev/null; }

# issue NAME SUBJECT EXTENSIONS: signs NAME.key's request with the test CA.
issue() {
  local name=$1 subject=$2 extensions=$3
  openssl req -new -key "$name.key" -subj "$subject" -out "$work/$name.csr"
  printf '%s\n' "$extensions" > "$work/$name.ext"
  openssl x509 -req -in "$work/$name.csr" -CA ca.pem -CAkey ca.key -CAcreateserial \
    -CAserial "$work/ca.srl" -days "$days" -sha256 -extfile "$work/$name.ext" -out "$name.pem" 2>/dev/null
}

signer_ext="basicConstraints=critical,CA:FALSE
keyUsage=critical,digitalSignature"
client_ext="basicConstraints=critical,CA:FALSE
keyUsage=critical,digitalSignature
extendedKeyUsage=clientAuth"
tls_ext="basicConstraints=critical,CA:FALSE
keyUsage=critical,digitalSignature,keyEncipherment
extendedKeyUsage=serverAuth
subjectAltName=DNS:localhost,IP:127.0.0.1,IP:::1"
other_tls_ext="basicConstraints=critical,CA:FALSE
keyUsage=critical,digitalSignature,keyEncipherment
extendedKeyUsage=serverAuth
subjectAltName=DNS:other.example"

rsa_key ca.key
openssl req -x509 -new -key ca.key -subj "/O=SsoClient Tests/CN=Test CA" -days "$days" -sha256 \
  -addext "basicConstraints=critical,CA:TRUE" -addext "keyUsage=critical,keyCertSign,cRLSign" -out ca.pem

rsa_key sts.key;        issue sts "/O=SsoClient Tests/CN=Test STS Signer" "$signer_ext"
ec_key sts-ec.key;      issue sts-ec "/O=SsoClient Tests/CN=Test STS EC Signer" "$signer_ext"
rsa_key client.key;     issue client "/O=SsoClient Tests/CN=Test Holder-of-Key Client" "$client_ext"
rsa_key tls-server.key; issue tls-server "/O=SsoClient Tests/CN=localhost" "$tls_ext"
rsa_key tls-other.key;  issue tls-other "/O=SsoClient Tests/CN=other.example" "$other_tls_ext"

# A self-signed signer that chains to nothing trusted.
rsa_key untrusted.key
openssl req -x509 -new -key untrusted.key -subj "/O=Somebody Else/CN=Untrusted Signer" -days "$days" \
  -sha256 -out untrusted.pem

# A signer issued by the test CA whose validity ended in 2001.
rsa_key expired-sts.key
openssl req -new -key expired-sts.key -subj "/O=SsoClient Tests/CN=Expired STS Signer" -out "$work/expired.csr"
mkdir -p "$work/ca/newcerts"
: > "$work/ca/index.txt"
echo 1000 > "$work/ca/serial"
cat > "$work/ca.cnf" <<CNF
[ca]
default_ca = test
[test]
dir = $work/ca
database = \$dir/index.txt
new_certs_dir = \$dir/newcerts
serial = \$dir/serial
default_md = sha256
policy = any
unique_subject = no
copy_extensions = none
[any]
organizationName = optional
commonName = supplied
[signer]
basicConstraints = critical,CA:FALSE
keyUsage = critical,digitalSignature
CNF
openssl ca -batch -config "$work/ca.cnf" -cert ca.pem -keyfile ca.key -in "$work/expired.csr" \
  -startdate 010101000000Z -enddate 011231235959Z -extensions signer -notext -out expired-sts.pem 2>/dev/null

echo "Regenerated keys in $(pwd)"
