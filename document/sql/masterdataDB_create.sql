CREATE TABLE meta (
    key TEXT PRIMARY KEY,
    value TEXT NOT NULL
);

CREATE TABLE vdr (
    id INTEGER NOT NULL PRIMARY KEY,
    name VARCHAR(64),
    createdate DATETIME,
    headline_left TEXT,
    headline_center TEXT,
    headline_right TEXT,
    footer_left TEXT,
    footer_center TEXT,
    footer_right TEXT
);

CREATE TABLE company (
    id INTEGER NOT NULL PRIMARY KEY,
    category INTEGER NOT NULL,
    type VARCHAR(64),
    firstname VARCHAR(64),
    lastname VARCHAR(64),
    company VARCHAR(128),
    street VARCHAR(128),
    plz VARCHAR(16),
    city VARCHAR(64),
    telephone VARCHAR(64),
    telefax VARCHAR(64),
    mobile VARCHAR(64),
    email VARCHAR(128),
    pos INTEGER
);

CREATE TABLE locked_reports (
    id INTEGER,
    user_id VARCHAR(64),
    creation_date DATETIME
);
