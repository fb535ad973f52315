// Checks NMEA sentences with an independent parser: every line of the file given must parse
// with a valid checksum. Exit 0: all good; 1: a bad line; 77: the parser is not installed.
let nmea;
try {
  nmea = require('nmea-simple');
} catch (e) {
  console.log('nmea-simple not installed');
  process.exit(77);
}
const fs = require('fs');
const lines = fs.readFileSync(process.argv[2], 'latin1').split('\r\n').filter((l) => l.length);
for (const line of lines) {
  try {
    const s = nmea.parseNmeaSentence(line);
    if (!s.chxOk) throw new Error('checksum');
    console.log(s.sentenceId, JSON.stringify(s.latitude ?? s.datetime), JSON.stringify(s.longitude ?? ''));
  } catch (e) {
    console.log('BAD', line, e.message);
    process.exit(1);
  }
}
