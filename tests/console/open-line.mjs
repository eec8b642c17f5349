// The appliance's side of a sealed line, in WebCrypto: it opens what the host has
// sealed, so that neither side is compared with itself only.
import "./webcrypto.mjs";
import {fromBase64Url, lineCipher} from "../../console/cipher.js";

const subtle = globalThis.crypto.subtle;
const PREFIX = "~talo-line.1~";
const HEAD_BYTES = 42;
const HALF_AT = 10;

// What a PKCS #8 document of X25519 has before the 32 bytes.
const PKCS8_HEAD = Buffer.from("302e020100300506032b656e04220420", "hex");

/** `secret` and `publicKey` are base64url. Throws where a line cannot be opened. */
export async function openLine(secret, publicKey, text) {
    if (!text.startsWith(PREFIX)) {
        throw new Error("no prefix");
    }
    const bytes = fromBase64Url(text.slice(PREFIX.length));
    const head = bytes.slice(0, HEAD_BYTES);
    const sender = head.slice(HALF_AT);
    const own = await subtle.importKey(
        "pkcs8", Buffer.concat([PKCS8_HEAD, fromBase64Url(secret)]), {name: "X25519"}, false,
        ["deriveBits"]);
    const other = await subtle.importKey("raw", sender, {name: "X25519"}, true, []);
    const shared = await subtle.deriveBits({name: "X25519", public: other}, own, 256);
    const {key, iv} = await lineCipher(shared, sender, fromBase64Url(publicKey));
    const cipher = await subtle.importKey("raw", key, "AES-GCM", false, ["decrypt"]);
    const plain = Buffer.from(await subtle.decrypt(
        {name: "AES-GCM", iv, additionalData: head}, cipher, bytes.slice(HEAD_BYTES)));
    return {
        version: head[0],
        keyId: head.slice(1, HALF_AT),
        time: Number(plain.readBigUInt64BE(0)),
        nonce: plain.subarray(8, 24),
        line: plain.subarray(24).toString("utf-8"),
    };
}
