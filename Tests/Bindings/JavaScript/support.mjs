// What the tests of the JavaScript module share. The environment says where things are.

import { spawnSync } from 'node:child_process';
import { mkdtempSync, readdirSync, readFileSync, rmSync } from 'node:fs';
import { tmpdir } from 'node:os';
import { extname, join } from 'node:path';
import { pathToFileURL } from 'node:url';

const { ZULM_PATH: tool, ZULM_PACKAGE: folder, ZULM_TEST_DATA: data, ZULM_SESSION_NUMBERS: numbers } = process.env;

export const packageFolder = folder;
export const load = (name) => import(pathToFileURL(join(folder, name)));

/** What the tool prints, whatever it thinks of the file. */
export function zulm(...args) {
  const { stdout, stderr, status, error } = spawnSync(tool, args, { encoding: 'utf8', maxBuffer: 1 << 28 });
  if (error) throw error;
  return { stdout, stderr, status };
}

/** What a command reports of files, by their paths. */
export function reportsOf(command, files) {
  const reports = JSON.parse(zulm(command, '--json', ...files).stdout).files;
  return new Map(reports.map((report) => [report.path, report]));
}

/** Removed behind the tests of a file. */
export function temporaryFolder(after) {
  const path = mkdtempSync(join(tmpdir(), 'zulm-js-'));
  after(() => rmSync(path, { recursive: true, force: true }));
  return path;
}

/** The simulated session of the demo: a movie and a stream file of every kind. */
export function recordedSession(folder) {
  const { status, stderr } = zulm('demo', folder);
  if (status !== 0) throw new Error(stderr);
  const streams = join(folder, 'streams');
  return { movie: join(folder, 'Recording.mp4'), streams: readdirSync(streams).map((name) => join(streams, name)) };
}

/** Every damaged file of the corpus. */
export function damagedFiles() {
  const known = new Set(['.mp4', '.mov', '.avi', '.wav', '.dat']);
  const corpus = join(data, 'invalid');
  return readdirSync(corpus)
    .filter((name) => known.has(extname(name)))
    .map((name) => join(corpus, name));
}

export const bytesOf = (file) => new Uint8Array(readFileSync(file));

/** What the C++ library computes from a recording. */
export function sessionNumbers(file, edits) {
  const { stdout, stderr, status } = spawnSync(numbers, [file, edits], { encoding: 'utf8', maxBuffer: 1 << 28 });
  if (status !== 0) throw new Error(stderr);
  return JSON.parse(stdout);
}
