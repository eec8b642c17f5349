// console/cipher.js against the host's own ciphers, both ways.
//
//     node cipher-test.mjs PEER docs/enciphered-parameters.md
import assert from "node:assert/strict";
import {spawn} from "node:child_process";
import {readFileSync} from "node:fs";
import {createInterface} from "node:readline";

import "./webcrypto.mjs";
import * as cipher from "../../console/cipher.js";
import {openLine} from "./open-line.mjs";

const [peerProgram, document] = process.argv.slice(2);
const PREFIX = "~talo-line.1~";
const b64 = text => cipher.toBase64Url(Buffer.from(text));
const fromHex = hex => cipher.toBase64Url(Buffer.from(hex, "hex"));

/** The host's side: one answer for each command. */
class Peer {
    constructor() {
        this.process = spawn(peerProgram, [], {stdio: ["pipe", "pipe", "inherit"]});
        this.answers = createInterface({input: this.process.stdout})[Symbol.asyncIterator]();
    }
    /** The results as bytes, or null where the host refuses. */
    async ask(command, ...words) {
        this.process.stdin.write([command, ...words.map(word => b64(word))].join(" ") + "\n");
        const {value} = await this.answers.next();
        if (value === "refused") {
            return null;
        }
        const [verdict, ...results] = value.split(" ");
        assert.equal(verdict, "ok", value);
        return results.map(text => Buffer.from(cipher.fromBase64Url(text)));
    }
    async text(command, ...words) {
        const results = await this.ask(command, ...words);
        return results === null ? null : results[0].toString("utf-8");
    }
    async end() {
        this.process.stdin.end();
        return new Promise(resolve => this.process.on("close", resolve));
    }
}

const peer = new Peer();

const LINES = [
    "",
    "a=1",
    "api=TALO.System&version=1&method=info",
    '{"api":"TALO.System","version":1}',
    "name=J%C3%BCrgen&plain=J\u00fcrgen \u20ac \u{1F600}",
    PREFIX + "AAAA",
    "x".repeat(2048),
    "\u20ac".repeat(100001),
];

const TOKENS = ["t", "0123456789abcdefghijklmnopqrstuv", "t\u00f6ken \u20ac", "x".repeat(4096)];

/** The names and values of the worked example. */
function example() {
    const block = readFileSync(document, "utf-8").match(/```example\n([^]*?)```/)[1];
    const pairs = [...block.matchAll(/^(\S[^=\n]*?) = (.*)$/gm)].map(found => found.slice(1));
    assert.ok(pairs.length >= 13, block);
    return Object.fromEntries(pairs);
}

/** Every text that differs from this one in one character. */
function* alterations(text, from = 0) {
    const ALPHABET = "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789-_";
    for (let at = from; at < text.length; ++at) {
        for (let bit = 0; bit < 6; ++bit) {
            const other = ALPHABET[ALPHABET.indexOf(text[at]) ^ (1 << bit)];
            yield text.slice(0, at) + other + text.slice(at + 1);
        }
    }
}

const secret = Buffer.from(Array.from({length: 32}, (_, index) => index * 7 + 1));
const [publicHalf] = await peer.ask("public", secret);
const publicKey = b64(publicHalf);

const tests = {
    async "both sides derive the same key text from a token"() {
        for (const token of TOKENS) {
            const text = await cipher.keyTextOf(token);
            assert.match(text, /^[A-Za-z0-9_-]{32}$/);
            assert.equal(await peer.text("key-text", token), text);
        }
        assert.equal(await peer.ask("key-text", ""), null);
        await assert.rejects(cipher.keyTextOf(""));
    },

    async "the host deciphers what the browser enciphered with a token"() {
        for (const token of TOKENS) {
            for (const line of LINES) {
                const text = await cipher.encipherWithToken(token, line);
                const key = await cipher.keyTextOf(token);
                assert.equal(await peer.text("decipher", key, text), line);
            }
        }
    },

    async "the browser deciphers what the host enciphered with a token"() {
        for (const token of TOKENS) {
            const key = await peer.text("key-text", token);
            for (const line of LINES) {
                const text = await peer.text("encipher", key, line);
                assert.equal(await cipher.decipherWithToken(token, text), line);
            }
        }
    },

    async "a text under another token is refused by both sides"() {
        const text = await cipher.encipherWithToken("one", "a=1");
        assert.equal(await peer.ask("decipher", await cipher.keyTextOf("two"), text), null);
        await assert.rejects(cipher.decipherWithToken("two", text));
    },

    async "an altered or cut text is refused by both sides"() {
        const key = await cipher.keyTextOf("token");
        const text = await cipher.encipherWithToken("token", "a=1");
        for (const altered of alterations(text)) {
            assert.equal(await peer.ask("decipher", key, altered), null, altered);
            await assert.rejects(cipher.decipherWithToken("token", altered));
        }
        for (let size = 0; size < text.length; ++size) {
            assert.equal(await peer.ask("decipher", key, text.slice(0, size)), null);
            await assert.rejects(cipher.decipherWithToken("token", text.slice(0, size)));
        }
    },

    async "the host opens what the browser sealed, with its time"() {
        for (const line of LINES) {
            const text = await cipher.encipherLine(publicKey, line, 1800000123.9);
            assert.ok(text.startsWith(PREFIX));
            const [opened, time] = await peer.ask("open", secret, text);
            assert.equal(opened.toString("utf-8"), line);
            assert.equal(time.toString(), "1800000123");
        }
    },

    async "WebCrypto opens what the host sealed"() {
        for (const line of LINES) {
            const text = await peer.text("seal", publicHalf, line, "1800000000");
            const opened = await openLine(b64(secret), publicKey, text);
            assert.equal(opened.line, line);
            assert.equal(opened.time, 1800000000);
            assert.equal(opened.version, 1);
            assert.deepEqual(Buffer.from(opened.keyId), publicHalf.subarray(0, 9));
        }
    },

    async "a sealed line is refused by another key, altered or cut"() {
        const text = await cipher.encipherLine(publicKey, "a=1", 1800000000);
        const other = Buffer.from(secret.map(byte => byte ^ 0xff));
        assert.notEqual(await peer.ask("open", secret, text), null);
        assert.equal(await peer.ask("open", other, text), null);
        for (const altered of alterations(text, PREFIX.length)) {
            assert.equal(await peer.ask("open", secret, altered), null, altered);
        }
        for (let size = 0; size < text.length; ++size) {
            assert.equal(await peer.ask("open", secret, text.slice(0, size)), null);
        }
    },

    async "no two texts of one line are alike"() {
        const texts = new Set();
        for (let turn = 0; turn < 20; ++turn) {
            texts.add(await cipher.encipherLine(publicKey, "a=1", 1800000000));
            texts.add(await cipher.encipherWithToken("token", "a=1"));
        }
        assert.equal(texts.size, 40);
    },

    async "a key that agrees on nothing is refused"() {
        for (const key of ["", "A", b64(Buffer.alloc(31)), b64(Buffer.alloc(32)), "!".repeat(43)]) {
            await assert.rejects(cipher.encipherLine(key, "a=1"), undefined, key);
        }
    },

    "URL-safe base64 is taken in its one form only"() {
        for (const text of ["A", "AB==", "AA=", "A+==", "AB", "AAB", "A A", "AA\n", "AAAAA", "\u00e4a"]) {
            assert.throws(() => cipher.fromBase64Url(text), undefined, text);
        }
        for (let size = 0; size < 70000; size = size * 2 + 1) {
            const bytes = new Uint8Array(size).map((_, index) => index * 31);
            const text = cipher.toBase64Url(bytes);
            assert.equal(text, Buffer.from(bytes).toString("base64url"));
            assert.deepEqual(cipher.fromBase64Url(text), bytes);
        }
    },

    "the appliance's clock goes on from what it told"() {
        const now = cipher.applianceClock(1800000000);
        assert.ok(now() >= 1800000000 && now() < 1800000060);
    },

    async "the documented example is what both sides compute"() {
        const is = example();
        assert.equal(await cipher.keyTextOf(is["token"]), is["key text"]);
        assert.equal(await peer.text("key-text", is["token"]), is["key text"]);
        const salt = Buffer.from("talo-parameter-token");
        const aesKey = await cipher.derive(Buffer.from(is["key text"]), salt, "aes-key-1", 32);
        assert.equal(Buffer.from(aesKey).toString("hex"), is["AES key"]);
        assert.equal(await cipher.decipherWithToken(is["token"], is["enciphered text"]), is["line"]);
        assert.equal(await peer.text("decipher", is["key text"], is["enciphered text"]), is["line"]);
        assert.equal(Buffer.from(cipher.fromBase64Url(is["enciphered text"])).toString("hex")
                         .slice(0, 26), "01" + is["text's nonce"]);

        const own = cipher.fromBase64Url(fromHex(is["appliance's secret"]));
        assert.equal(b64((await peer.ask("public", own))[0]), is["key"]);
        assert.equal(is["key"].slice(0, 12), is["key_id"]);
        const sender = cipher.fromBase64Url(fromHex(is["sender's secret"]));
        assert.equal((await peer.ask("public", sender))[0].toString("hex"),
                     is["sender's public half"]);
        const opened = await openLine(b64(own), is["key"], is["sealed line"]);
        assert.equal(opened.line, is["line"]);
        assert.equal(String(opened.time), is["time"]);
        assert.equal(opened.nonce.toString("hex"), is["line's nonce"]);
        assert.equal((await peer.ask("open", own, is["sealed line"]))[0].toString(), is["line"]);
    },
};

let failed = 0;
for (const [name, test] of Object.entries(tests)) {
    try {
        await test();
        console.log(`ok      ${name}`);
    } catch (error) {
        ++failed;
        console.log(`FAILED  ${name}\n${error.stack}`);
    }
}
assert.equal(await peer.end(), 0);
process.exitCode = failed === 0 ? 0 : 1;
