// Writes files of Parquet with DuckDB: node write.cjs < REQUEST
//
// The request is a JSON object. It comes on standard input, because it may be longer than an argument. "folder" is where
// its names begin. "lines" names a file with one JSON object in each line, "columns" has the names and types of its
// columns, and "longest" is the size of its longest line; or else "parts" names files of Parquet that become one.
// "output" names the new file. An empty request writes nothing, and fails if DuckDB is not installed.
'use strict';

const { readFileSync } = require('node:fs');

const MIB = 2 ** 20;
const MEMORY = 256 * MIB;
const ROW_GROUP = 16 * MIB;
const LONGEST_LINE = 16 * MIB; // for which the memory suffices

const quoted = text => `'${text.replaceAll("'", "''")}'`;

/** Returns the query for the rows. */
function rowsOf({ parts, lines, columns, longest }) {
    if (parts)
        return `SELECT * FROM read_parquet([${parts.map(quoted)}], hive_partitioning = false)`;
    const types = Object.entries(columns);
    const values = types.map(([name, type]) => (type === 'BLOB' ? `from_base64("${name}") AS "${name}"` : `"${name}"`));
    const read = types.map(([name, type]) => `${quoted(name)}: ${quoted(type === 'BLOB' ? 'VARCHAR' : type)}`);
    return `SELECT ${values} FROM read_json(${quoted(lines)}, format = 'newline_delimited', columns = {${read}},
        hive_partitioning = false, maximum_object_size = ${Math.max(longest + 1, LONGEST_LINE)})`;
}

async function write(request) {
    const { DuckDBInstance } = require('@duckdb/node-api');
    if (!request.output)
        return;
    process.umask(0o077); // only the owner may read the file until it is whole
    process.chdir(request.folder); // names from here on have no character that stands for others
    const memory = MEMORY + 16 * Math.max(0, (request.longest ?? 0) - LONGEST_LINE);
    const instance = await DuckDBInstance.create(':memory:', {
        threads: '1', // so that rows keep their order
        memory_limit: `${memory} B`,
        temp_directory: '',
        autoinstall_known_extensions: 'false',
        autoload_known_extensions: 'false',
    });
    const connection = await instance.connect();
    await connection.run('SET preserve_insertion_order = false'); // which the limit of a row group asks for
    await connection.run(`COPY (${rowsOf(request)}) TO ${quoted(request.output)} (FORMAT parquet, COMPRESSION zstd,
        ROW_GROUP_SIZE_BYTES ${ROW_GROUP}, USE_TMP_FILE false)`);
}

const parent = process.ppid;
setInterval(() => process.ppid === parent || process.exit(1), 500).unref(); // nobody waits for the file then

write(JSON.parse(readFileSync(process.stdin.fd, 'utf8'))).catch(error => {
    const isMissing = error.code === 'MODULE_NOT_FOUND';
    console.error(isMissing ? `DuckDB is not installed; run 'npm ci' in ${__dirname}` : error.message);
    process.exitCode = 1;
});
