// The severities of events and findings, gravest first.
export const kSeverities = ['critical', 'error', 'warning', 'information', 'other'];

const kNames = new Map([
  ['critical', 'critical'],
  ['error', 'error'],
  ['failure audit', 'error'],
  ['audit failure', 'error'],
  ['warning', 'warning'],
  ['info', 'information'],
  ['information', 'information'],
  ['informational', 'information'],
]);

export function severityOf(text) {
  return kNames.get(String(text).trim().toLowerCase()) ?? 'other';
}
