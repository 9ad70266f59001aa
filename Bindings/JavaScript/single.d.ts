export * from './zulmetadata.js';
