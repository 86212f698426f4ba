CREATE TABLE id_generator (
    id_table TEXT PRIMARY KEY,
    id_counter INTEGER NOT NULL DEFAULT 0
);

CREATE TABLE meta (
    key TEXT PRIMARY KEY,
    value TEXT NOT NULL
);

CREATE TABLE documents (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    tablename TEXT,
    documentname TEXT NOT NULL,
    document_content BLOB,
    record_id INTEGER,
    status INTEGER,
    orig_record_id INTEGER NOT NULL DEFAULT -1,
    orig_entry_id INTEGER NOT NULL DEFAULT -1
);
