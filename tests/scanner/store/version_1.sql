-- A database of the first version, as a scan of that version left it.
CREATE TABLE scans (
  id INTEGER PRIMARY KEY,
  time REAL NOT NULL,
  machine TEXT NOT NULL,
  toolVersion TEXT NOT NULL
);
INSERT INTO scans VALUES (1, 1700000000.25, 'studio', '0.2.0');
CREATE TABLE results (
  id INTEGER PRIMARY KEY,
  scan INTEGER NOT NULL REFERENCES scans (id),
  bundle BLOB NOT NULL,
  processor TEXT NOT NULL,
  child INTEGER,
  childName TEXT,
  device INTEGER NOT NULL,
  inode INTEGER NOT NULL,
  size INTEGER NOT NULL,
  changedAt INTEGER NOT NULL,
  worker TEXT NOT NULL,
  options TEXT NOT NULL,
  sandboxWanted TEXT NOT NULL,
  isSandboxed INTEGER NOT NULL,
  libraries TEXT NOT NULL,
  format INTEGER NOT NULL,
  toolVersion TEXT NOT NULL,
  verdict TEXT NOT NULL,
  step INTEGER,
  cause TEXT NOT NULL,
  isFlaky INTEGER NOT NULL,
  time REAL NOT NULL,
  wallSeconds REAL NOT NULL,
  children TEXT,
  event TEXT
);
INSERT INTO results VALUES (1, 1, X'2F6C69622FFF2E736F', 'x86_64', NULL, NULL, 1, 2, 3, 4, 'worker', 'options', 'auto', 1,
  'libraries', 1, '0.2.0', 'crashed', 5, 'step 5: SIGSEGV', 0, 1700000001.5, 0.25, NULL, '{"event":"plugin_ended"}');
INSERT INTO results VALUES (2, 1, X'2F6C69622F7368656C6C2E736F', 'x86_64', -7, 'Third', 1, 2, 3, 4, 'worker', 'options',
  'auto', 1, 'libraries', 1, '0.2.0', 'passed', NULL, '', 0, 1700000002.5, 2.5, NULL, '{"event":"plugin_ended"}');
CREATE INDEX resultsByPlugin ON results (bundle, processor, child, id);
CREATE TABLE programs (
  path BLOB PRIMARY KEY,
  identity TEXT NOT NULL,
  says TEXT NOT NULL
);
INSERT INTO programs VALUES (X'2F776F726B6572', '1:2:3', 'vsttorture-worker 0.2.0');
CREATE VIEW latest AS
  SELECT CAST(bundle AS TEXT) AS path, processor, child, childName, verdict, step, cause, isFlaky, time,
         wallSeconds, toolVersion, event
  FROM results WHERE id IN (SELECT max(id) FROM results GROUP BY bundle, processor, child);
PRAGMA application_id = 1987277940;
PRAGMA user_version = 1;
