// Searches a list of names with one npm package: node peers.js PACKAGE INPUT.json, from a directory
// that has the package. Prints {version, build_ms, memory_mib, keystrokes: [[us, [places]], ...]}.
"use strict";
const fs = require("fs");
const path = require("path");

const ROUNDS = 3;
const [, , name, inputFile] = process.argv;
const { names, keystrokes } = JSON.parse(fs.readFileSync(inputFile, "utf8"));
const modules = path.join(process.cwd(), "node_modules");
const load = () => require(path.join(modules, name));

// Each returns a function from a text to the places of the names found.
const searchers = {
  "pinyin-match": () => {
    const { match } = load();
    return (text) => places((candidate) => match(candidate, text) !== false);
  },
  "pinyin-pro": () => {
    const { match } = load();
    const options = { precision: "start", continuous: true };
    return (text) => places((candidate) => match(candidate, text, options) !== null);
  },
  "pinyin-engine": () => {
    const Engine = load();
    const engine = new Engine(names.map((candidate, place) => ({ candidate, place })), ["candidate"]);
    return (text) => engine.query(text).map((entry) => entry.place);
  },
};

function places(isFound) {
  const found = [];
  names.forEach((candidate, place) => {
    if (isFound(candidate)) {
      found.push(place);
    }
  });
  return found;
}

function measure(search, text) {
  const times = [];
  let found = [];
  for (let i = 0; i < ROUNDS; ++i) {
    const begin = process.hrtime.bigint();
    found = search(text);
    times.push(Number(process.hrtime.bigint() - begin) / 1e3);
  }
  return [times.sort((a, b) => a - b)[(ROUNDS - 1) / 2], found];
}

const memoryBefore = process.memoryUsage().rss;
const begin = process.hrtime.bigint();
const search = searchers[name]();
const buildMs = Number(process.hrtime.bigint() - begin) / 1e6;
const answers = keystrokes.map((text) => measure(search, text));
const memory = process.memoryUsage().rss - memoryBefore;
const { version } = JSON.parse(fs.readFileSync(path.join(modules, name, "package.json"), "utf8"));
console.log(JSON.stringify({ version, build_ms: buildMs, memory_mib: memory / 2 ** 20,
                             keystrokes: answers }));
