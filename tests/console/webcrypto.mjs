// What a browser has from the start, and Node before version 20 only as a module.
import {webcrypto} from "node:crypto";

globalThis.crypto ??= webcrypto;
