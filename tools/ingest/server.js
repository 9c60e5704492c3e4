#!/usr/bin/env node
// Receives packages over tus 1.0 (resumable HTTP uploads). README.md says how to run it; verified_store.js keeps the
// files.

import {timingSafeEqual} from 'node:crypto'
import fs from 'node:fs'
import http from 'node:http'
import https from 'node:https'
import path from 'node:path'
import {finished} from 'node:stream/promises'
import {parseArgs} from 'node:util'

import {Server} from '@tus/server'

import {VerifiedStore} from './verified_store.js'

const CATEGORY = 'kvsetuplogs'
const ROUTE = '/files'
const UPLOAD_ID = /^[0-9a-f]{32}$/ // what the tus server draws: 128 random bits
const STALLED_CONNECTION = 120_000 // milliseconds without a byte
const REFUSED_BODY = 30_000 // milliseconds that a sender gets to finish writing what is refused
const CLEAN_UP_INTERVAL = 3_600_000 // milliseconds
const PARENT_CHECK_INTERVAL = 500 // milliseconds

const OPTIONS = {
  folder: {type: 'string'},
  host: {type: 'string', default: '127.0.0.1'},
  port: {type: 'string', default: '8443'},
  cert: {type: 'string'},
  key: {type: 'string'},
  'max-bytes': {type: 'string', default: String(2 ** 30)},
  'key-header': {type: 'string', default: 'X-Api-Key'},
  'unfinished-hours': {type: 'string', default: '24'},
  'end-with-parent': {type: 'boolean', default: false},
}

function report(...words) {
  console.error(new Date().toISOString(), ...words)
}

function number(options, name, least, most) {
  const value = Number(options[name])
  if (options[name].trim() === '' || !(value >= least && value <= most)) {
    throw new Error(`--${name} must be a number from ${least} to ${most}`)
  }
  return value
}

function readOptions() {
  const {values} = parseArgs({options: OPTIONS})
  if (!values.folder) {
    throw new Error('--folder is missing: where the uploads are kept')
  }
  if (Boolean(values.cert) !== Boolean(values.key)) {
    throw new Error('--cert and --key belong together')
  }
  return {
    folder: path.resolve(values.folder),
    host: values.host,
    port: number(values, 'port', 0, 65535),
    tls: values.cert && {cert: fs.readFileSync(values.cert), key: fs.readFileSync(values.key), minVersion: 'TLSv1.2'},
    maxSize: number(values, 'max-bytes', 1, Number.MAX_SAFE_INTEGER),
    apiKey: process.env.INGEST_API_KEY ?? '', // not an option: other users can read command lines
    keyHeader: values['key-header'],
    unfinishedFor: number(values, 'unfinished-hours', 0, 24 * 365) * 3_600_000,
    endWithParent: values['end-with-parent'],
  }
}

function refusal(status_code, sentence) {
  return {status_code, body: `${sentence}\n`}
}

function isJson(text) {
  try {
    JSON.parse(text)
    return true
  } catch {
    return false
  }
}

const METADATA_RULES = [
  ['category', (text) => text === CATEGORY, 403, `Only uploads of the category "${CATEGORY}" are accepted.`],
  ['filename', (text) => text.length > 0 && text.length <= 255, 400, 'The filename must have 1 to 255 characters.'],
  ['tags', isJson, 400, 'The tags must be JSON.'],
  ['sha256', (text) => /^[0-9a-f]{64}$/.test(text), 400, 'The sha256 must be 64 lower-case hexadecimal digits.'],
]

// Returns the refusal of an upload with these metadata, or undefined.
function refuseMetadata(metadata = {}) {
  for (const [name, accepts, status, sentence] of METADATA_RULES) {
    if (typeof metadata[name] !== 'string') {
      return refusal(400, `The upload's metadata lack "${name}".`)
    }
    if (!accepts(metadata[name])) {
      return refusal(status, sentence)
    }
  }
  return undefined
}

function sameSecret(given, expected) {
  const [a, b] = [Buffer.from(given ?? ''), Buffer.from(expected)]
  return a.length === b.length && timingSafeEqual(a, b)
}

// The tus server closes the connection after a refusal. While the sender still writes, that would reset the connection
// and the sender would never read why: so the body is first read and dropped. (One that the store gave up on halfway
// cannot be.)
async function dropBody(message) {
  if (!message.readableDidRead) {
    message.resume()
    await finished(message, {writable: false, signal: AbortSignal.timeout(REFUSED_BODY)}).catch(() => {})
  }
}

function makeTusServer(options, store) {
  return new Server({
    path: ROUTE,
    datastore: store,
    maxSize: options.maxSize,
    relativeLocation: true, // right behind every proxy, and never a plain-HTTP address for an HTTPS upload
    allowedOrigins: [], // no browsers
    lockDrainTimeout: 1000, // how long a half-dead connection keeps its successor waiting (milliseconds)
    disableTerminationForFinishedUploads: true,
    getFileIdFromRequest: (_request, id) => (UPLOAD_ID.test(id) ? id : undefined),
    async onIncomingRequest(request) {
      if (options.apiKey && !sameSecret(request.headers.get(options.keyHeader), options.apiKey)) {
        throw refusal(401, `The header ${options.keyHeader} does not hold a valid key.`)
      }
      if (request.method === 'GET') {
        throw refusal(405, 'Uploads are received here, not handed out.')
      }
    },
    async onUploadCreate(_request, upload) {
      const refused = refuseMetadata(upload.metadata)
      if (refused) {
        throw refused
      }
      return {}
    },
    async onUploadFinish(_request, upload) {
      await store.settle(upload)
      report(`received ${upload.id}: ${upload.size} bytes, ${JSON.stringify(upload.metadata.filename)}`)
      return {}
    },
    async onResponseError(request, failure) {
      await dropBody(request.runtime.node.req)
      const {pathname} = new URL(request.url)
      if (!failure.status_code) {
        report(`failed ${request.method} ${pathname}:`, failure)
        return refusal(500, 'The server could not do this; its log says why.')
      }
      report(`refused ${request.method} ${pathname}: ${failure.status_code} ${failure.body.trim()}`)
      if (failure.status_code === 413) {
        return refusal(413, `The upload exceeds what it announced, or the ${options.maxSize} bytes accepted here.`)
      }
      return undefined
    },
  })
}

function makeListener(options, tus) {
  const answer = (request, response) => {
    if (request.url !== ROUTE && !request.url.startsWith(`${ROUTE}/`)) {
      response.writeHead(404).end('Uploads are received under /files.\n')
      return
    }
    tus.handle(request, response).catch((failure) => {
      report(`failed ${request.method}:`, failure)
      response.destroy()
    })
  }
  const listener = options.tls ? https.createServer(options.tls, answer) : http.createServer(answer)
  listener.requestTimeout = 0 // a large upload over a slow line may take hours; only a silent line is given up
  listener.timeout = STALLED_CONNECTION
  return listener
}

function endWithParent(stop) {
  const parent = process.ppid
  setInterval(() => process.ppid !== parent && stop(), PARENT_CHECK_INTERVAL).unref()
}

function expireUnfinished(tus, period) {
  const cleanUp = () =>
    tus.cleanUpExpiredUploads().then(
      (count) => count && report(`removed ${count} unfinished uploads`),
      (failure) => report('removing unfinished uploads failed:', failure),
    )
  setInterval(cleanUp, Math.min(period, CLEAN_UP_INTERVAL)).unref()
  return cleanUp()
}

async function main() {
  const options = readOptions()
  process.umask(0o077)
  fs.mkdirSync(path.join(options.folder, 'uploads'), {recursive: true})
  fs.mkdirSync(path.join(options.folder, 'receipts'), {recursive: true})

  const store = new VerifiedStore({folder: options.folder, expirationPeriodInMilliseconds: options.unfinishedFor})
  await store.settleLeftovers((id, failure) => report(`left over ${id}:`, failure.body?.trim() ?? failure))
  const tus = makeTusServer(options, store)
  if (options.unfinishedFor > 0) {
    await expireUnfinished(tus, options.unfinishedFor)
  }

  const listener = makeListener(options, tus)
  const stop = () => {
    listener.close(() => process.exit(0))
    listener.closeAllConnections()
  }
  process.on('SIGTERM', stop).on('SIGINT', stop)
  if (options.endWithParent) {
    endWithParent(stop)
  }
  listener.on('error', (failure) => {
    report('cannot listen:', failure.message)
    process.exit(1)
  })
  listener.listen(options.port, options.host, () => {
    const scheme = options.tls ? 'https' : 'http'
    const host = options.host.includes(':') ? `[${options.host}]` : options.host
    console.log(`listening on ${scheme}://${host}:${listener.address().port}${ROUTE}`)
  })
}

main().catch((failure) => {
  console.error(`ingest: ${failure.message}`)
  process.exit(2)
})
