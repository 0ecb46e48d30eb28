// Runs statements on a DuckDB file, in one thread, and prints the rows that they give. The package
// is looked for in the folder.

import { createRequire } from 'node:module';

const [folder, file, ...statements] = process.argv.slice(2);
const { DuckDBInstance } = createRequire(`${folder}/`)('@duckdb/node-api');
const instance = await DuckDBInstance.create(file, { threads: '1' });
const connection = await instance.connect();
for (const statement of statements) {
  const reader = await connection.runAndReadAll(statement);
  process.stdout.write(reader.getRows().map((row) => `${row.join('|')}\n`).join(''));
}
