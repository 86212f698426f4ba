CREATE TABLE meta (
    key TEXT PRIMARY KEY,
    value TEXT NOT NULL
);

CREATE TABLE image (
    id INTEGER NOT NULL PRIMARY KEY AUTOINCREMENT,
    image BLOB NOT NULL,
    image_ct TEXT NOT NULL,
    image_width INT NOT NULL,
    image_height INT NOT NULL,
    thumbnail BLOB NOT NULL,
    thumbnail_ct TEXT NOT NULL,
    thumbnail_width INT NOT NULL,
    thumbnail_height INT NOT NULL
);

CREATE TABLE entry (
    id INTEGER NOT NULL PRIMARY KEY,
    locked INTEGER NOT NULL,
    persistent_document BLOB,
    persistent_document_ct TEXT,
    number TEXT NOT NULL,
    inspection_date DATE NOT NULL,
    inspection_time_from TIME NOT NULL,
    inspection_time_to TIME NOT NULL,
    env_time TIME NOT NULL,
    env_weather1 TEXT NOT NULL,
    env_weather2 TEXT NOT NULL,
    env_weather3 TEXT NOT NULL,
    env_temperature TEXT NOT NULL,
    env_humidity TEXT NOT NULL,
    progress TEXT NOT NULL,
    deficiencies TEXT NOT NULL,
    tests TEXT,
    interventions TEXT,
    special_incidents TEXT,
    construction_material_sample INTEGER NOT NULL,
    notice TEXT,
    print_notice INTEGER NOT NULL,
    print_telephone_notice INTEGER NOT NULL,
    progress_audio_id INTEGER,
    user_id TEXT,
    creation_date DATETIME,
    exported_by_app INTEGER
);

CREATE TABLE entry_attendee (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    company_id INTEGER,
    comment TEXT NOT NULL,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_workforce (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    company_id INTEGER,
    comment TEXT NOT NULL,
    person_count INTEGER NOT NULL,
    person_type TEXT NOT NULL,
    man_hours REAL,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_time_recording (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    workforce_id INTEGER NOT NULL,
    person_count INTEGER NOT NULL,
    person_type TEXT NOT NULL,
    time_from TIME,
    time_to TIME,
    breaks INTEGER,
    hours REAL,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_progress (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    type INTEGER NOT NULL,
    description TEXT NOT NULL,
    company_id INTEGER,
    date DATE,
    roomname TEXT NOT NULL,
    roombook_number TEXT NOT NULL,
    pos INTEGER NOT NULL,
    image_cnt INTEGER
);

CREATE TABLE entry_photo (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    pos INTEGER NOT NULL,
    type INTEGER NOT NULL,
    photo_image_id INTEGER,
    caption TEXT NOT NULL,
    comment TEXT NOT NULL,
    company_id INTEGER,
    date DATE NOT NULL,
    relation_id INTEGER
);

CREATE TABLE entry_task (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    type INTEGER NOT NULL,
    description TEXT NOT NULL,
    company_id INTEGER,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_constructionmeasure (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    description TEXT NOT NULL,
    timefrom TIME NOT NULL,
    timeto TIME NOT NULL,
    company_id INTEGER,
    location TEXT,
    kks TEXT,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_constructionmaterial (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    material TEXT NOT NULL,
    quantity REAL,
    unit TEXT,
    process TEXT NOT NULL,
    company_id INTEGER,
    material_temperature INTEGER NOT NULL,
    conditions TEXT NOT NULL,
    workflow TEXT NOT NULL,
    note TEXT NOT NULL,
    document TEXT,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_scheduleddelivery (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    deliverynumber TEXT NOT NULL,
    deliveryindex TEXT NOT NULL,
    deliverydate DATE NOT NULL,
    company_id INTEGER,
    comment TEXT NOT NULL,
    document TEXT,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_telephone_notice (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    description TEXT NOT NULL,
    company_id INTEGER,
    time TIME NOT NULL,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_concern (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    description TEXT NOT NULL,
    company_id INTEGER,
    pos INTEGER NOT NULL
);

CREATE TABLE entry_equipment (
    id INTEGER NOT NULL PRIMARY KEY,
    entry_id INTEGER NOT NULL,
    equipment TEXT NOT NULL,
    operating_zone TEXT NOT NULL,
    company_id INTEGER,
    entry_time TIME,
    exit_time TIME,
    operating_time INTEGER,
    downtime INTEGER,
    downtime_reasons TEXT NOT NULL,
    comment TEXT NOT NULL,
    pos INTEGER NOT NULL
);

CREATE TABLE audio (
    id INTEGER NOT NULL PRIMARY KEY AUTOINCREMENT,
    recording BLOB NOT NULL,
    recording_date DATE NOT NULL,
    recording_time TIME NOT NULL,
    recording_status INTEGER NOT NULL
);

CREATE TABLE vdr (
    id INTEGER NOT NULL PRIMARY KEY,
    name VARCHAR(64) NOT NULL,
    createdate DATETIME NOT NULL,
    headline_left TEXT NOT NULL,
    headline_center TEXT NOT NULL,
    headline_right TEXT NOT NULL,
    footer_left TEXT NOT NULL,
    footer_center TEXT NOT NULL,
    footer_right TEXT NOT NULL
);

CREATE TABLE company (
    id INTEGER NOT NULL PRIMARY KEY,
    category INTEGER NOT NULL,
    type VARCHAR(64) NOT NULL,
    firstname VARCHAR(64) NOT NULL,
    lastname VARCHAR(64) NOT NULL,
    company VARCHAR(128) NOT NULL,
    street VARCHAR(128) NOT NULL,
    plz VARCHAR(16) NOT NULL,
    city VARCHAR(64) NOT NULL,
    telephone VARCHAR(64) NOT NULL,
    telefax VARCHAR(64) NOT NULL,
    mobile VARCHAR(64) NOT NULL,
    email VARCHAR(128) NOT NULL,
    pos INTEGER NOT NULL
);
