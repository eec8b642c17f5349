// Enciphers parameter lines for the appliance, in plain WebCrypto: an ES module
// for browsers and Node, without dependencies. The formats are described to the
// byte in docs/enciphered-parameters.md.
//
//     const {key, token, time} = (await call("TALO.Session", "cipher")).data;
//     const now = applianceClock(time);
//     fetch("/webapi/entry.cgi", {
//         method: "POST",
//         headers: {"Content-Type": "application/x-www-form-urlencoded"},
//         body: await encipherLine(key, "api=TALO.Session&version=1&method=open&…", now()),
//     });
//
// Browsers have WebCrypto on pages that came over https only (and from localhost).

const LINE_PREFIX = "~talo-line.1~";
const VERSION = 1;
const KEY_BYTES = 32;
const KEY_ID_BYTES = 9;
const NONCE_BYTES = 12;
const LINE_NONCE_BYTES = 16;
const TAG_BYTES = 16;

const LINE_INFO = "talo-line-1";
const TOKEN_SALT = "talo-parameter-token";
const KEY_TEXT_INFO = "key-text-1";
const AES_KEY_INFO = "aes-key-1";
const KEY_TEXT_SOURCE_BYTES = 24;

const subtle = globalThis.crypto.subtle;

const utf8 = text => new TextEncoder().encode(text);

const randomBytes = size => globalThis.crypto.getRandomValues(new Uint8Array(size));

function concat(...parts) {
    const whole = new Uint8Array(parts.reduce((size, part) => size + part.length, 0));
    let at = 0;
    for (const part of parts) {
        whole.set(part, at);
        at += part.length;
    }
    return whole;
}

/** URL-safe base64 without padding. */
export function toBase64Url(bytes) {
    const PIECE = 0x8000;  // more arguments than that are too many for a call
    let text = "";
    for (let at = 0; at < bytes.length; at += PIECE) {
        text += String.fromCharCode(...bytes.subarray(at, at + PIECE));
    }
    return btoa(text).replace(/\+/g, "-").replace(/\//g, "_").replace(/=+$/, "");
}

/** Back again. Throws for what toBase64Url does not give. */
export function fromBase64Url(text) {
    if (!/^[A-Za-z0-9_-]*$/.test(text) || text.length % 4 === 1) {
        throw new Error("no URL-safe base64");
    }
    const bytes = Uint8Array.from(atob(text.replace(/-/g, "+").replace(/_/g, "/")),
                                  letter => letter.charCodeAt(0));
    if (toBase64Url(bytes) !== text) {
        throw new Error("no URL-safe base64");
    }
    return bytes;
}

/** HKDF with SHA-256. */
export async function derive(secret, salt, info, size) {
    const key = await subtle.importKey("raw", secret, "HKDF", false, ["deriveBits"]);
    const how = {name: "HKDF", hash: "SHA-256", salt, info: utf8(info)};
    return new Uint8Array(await subtle.deriveBits(how, key, size * 8));
}

const aesKey = (bytes, use) => subtle.importKey("raw", bytes, "AES-GCM", false, [use]);

async function seal(key, iv, head, plain) {
    const how = {name: "AES-GCM", iv, additionalData: head, tagLength: TAG_BYTES * 8};
    return new Uint8Array(await subtle.encrypt(how, await aesKey(key, "encrypt"), plain));
}

async function open(key, iv, head, sealed) {
    const how = {name: "AES-GCM", iv, additionalData: head, tagLength: TAG_BYTES * 8};
    return new Uint8Array(await subtle.decrypt(how, await aesKey(key, "decrypt"), sealed));
}

/** The key and nonce of one sealed line, from what both halves agree on. */
export async function lineCipher(shared, sender, receiver) {
    const bytes = await derive(shared, concat(sender, receiver), LINE_INFO,
                               KEY_BYTES + NONCE_BYTES);
    return {key: bytes.slice(0, KEY_BYTES), iv: bytes.slice(KEY_BYTES)};
}

function timeBytes(seconds) {
    const bytes = new Uint8Array(8);
    new DataView(bytes.buffer).setBigUint64(0, BigInt(Math.floor(seconds)));
    return bytes;
}

/** A function that tells the appliance's time in seconds, from what it told last. */
export function applianceClock(time) {
    const told = Date.now();
    return () => time + (Date.now() - told) / 1000;
}

/**
 * Seals a parameter line to the appliance's public key. The answer is the whole
 * query string or body, or the text of the parameter "__cIpHeRtExT". It is good for
 * one request: the appliance takes no line twice. `time` is the appliance's, in
 * seconds; it may be ten minutes off.
 */
export async function encipherLine(publicKey, line, time = Date.now() / 1000) {
    const receiver = fromBase64Url(publicKey);
    const other = await subtle.importKey("raw", receiver, {name: "X25519"}, true, []);
    const own = await subtle.generateKey({name: "X25519"}, false, ["deriveBits"]);
    const sender = new Uint8Array(await subtle.exportKey("raw", own.publicKey));
    const shared = await subtle.deriveBits({name: "X25519", public: other}, own.privateKey, 256);
    const {key, iv} = await lineCipher(shared, sender, receiver);
    const head = concat([VERSION], receiver.subarray(0, KEY_ID_BYTES), sender);
    const plain = concat(timeBytes(time), randomBytes(LINE_NONCE_BYTES), utf8(line));
    return LINE_PREFIX + toBase64Url(concat(head, await seal(key, iv, head, plain)));
}

/** The key text of a token. */
export async function keyTextOf(token) {
    if (token === "") {
        throw new Error("the token is empty");
    }
    return toBase64Url(await derive(utf8(token), utf8(TOKEN_SALT), KEY_TEXT_INFO,
                                    KEY_TEXT_SOURCE_BYTES));
}

const tokenKey = async token =>
    derive(utf8(await keyTextOf(token)), utf8(TOKEN_SALT), AES_KEY_INFO, KEY_BYTES);

/**
 * Enciphers a parameter line under the key of a token: the text of the parameter
 * "__tXeTrEhPiC", which goes with the token as "__nEkOtReHpIc".
 */
export async function encipherWithToken(token, line) {
    const version = Uint8Array.of(VERSION);
    const iv = randomBytes(NONCE_BYTES);
    return toBase64Url(
        concat(version, iv, await seal(await tokenKey(token), iv, version, utf8(line))));
}

/** Back again. Throws for a text that was not made with the token, or was altered. */
export async function decipherWithToken(token, text) {
    const bytes = fromBase64Url(text);
    const version = bytes.slice(0, 1);
    const sealed = bytes.slice(1 + NONCE_BYTES);
    if (version[0] !== VERSION || sealed.length < TAG_BYTES) {
        throw new Error("no enciphered text");
    }
    const plain = await open(await tokenKey(token), bytes.slice(1, 1 + NONCE_BYTES), version, sealed);
    return new TextDecoder("utf-8", {fatal: true, ignoreBOM: true}).decode(plain);
}
