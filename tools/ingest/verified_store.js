// The store behind the server: nobody sees an upload as complete before its bytes were hashed, found to be those that
// the sender promised, and put on the disk with a receipt. That holds as well when the sender's connection breaks right
// after the last byte, or when the server ends while it hashes: the next look at the upload does what was left to do.

import {createHash} from 'node:crypto'
import fs from 'node:fs/promises'
import path from 'node:path'

import {FileStore} from '@tus/file-store'

// Hashes and flushes the file that `file` (a FileHandle, writable) has open.
async function sha256OfStoredFile(file) {
  const hash = createHash('sha256')
  for await (const chunk of file.createReadStream({highWaterMark: 1 << 20, autoClose: false})) {
    hash.update(chunk)
  }
  await file.sync()
  return hash.digest('hex')
}

// Nobody finds a half-written document under its final name.
async function writeWhole(target, text) {
  const temporary = `${target}.tmp`
  await fs.writeFile(temporary, text, {flush: true})
  await fs.rename(temporary, target)
}

async function exists(file) {
  return fs.access(file).then(() => true, () => false)
}

export class VerifiedStore extends FileStore {
  // Uploads lie in folder/uploads (the bytes as ID, the tus state as ID.json), receipts in folder/receipts (ID.json).
  // Both folders exist already. One process at a time may use them.
  constructor({folder, expirationPeriodInMilliseconds}) {
    super({directory: path.join(folder, 'uploads'), expirationPeriodInMilliseconds})
    this.extensions = this.extensions.filter((name) => name !== 'creation-defer-length')
    this.receipts = path.join(folder, 'receipts')
    this.settling = new Map()
  }

  // HEAD and PATCH ask here where an upload stands, so this is where a complete one is settled first.
  async getUpload(id) {
    const upload = await super.getUpload(id)
    if (upload.offset === upload.size) {
      await this.settle(upload)
    }
    return upload
  }

  // Verifies a complete upload and writes its receipt, once however many ask. On a mismatch the upload is removed and
  // every caller gets the refusal {status_code, body}.
  settle(upload) {
    let work = this.settling.get(upload.id)
    if (!work) {
      work = this.#verify(upload).finally(() => this.settling.delete(upload.id))
      this.settling.set(upload.id, work)
    }
    return work
  }

  // Settles what an earlier process left complete but without a receipt.
  async settleLeftovers(report) {
    for (const id of await this.configstore.list()) {
      await this.getUpload(id).catch((failure) => report(id, failure))
    }
  }

  // Only unfinished uploads expire. (The base class would remove finished ones too.)
  async deleteExpired() {
    let removed = 0
    for (const id of await this.configstore.list()) {
      const state = await this.configstore.get(id)
      const age = Date.now() - Date.parse(state?.creation_date)
      if (age > this.getExpiration() && !(await exists(this.#receiptPath(id)))) {
        await this.remove(id)
        removed += 1
      }
    }
    return removed
  }

  #receiptPath(id) {
    return path.join(this.receipts, `${id}.json`)
  }

  async #verify({id, size, metadata}) {
    if (await exists(this.#receiptPath(id))) {
      return
    }
    const file = await fs.open(path.join(this.directory, id), 'r+')
    let sha256
    try {
      sha256 = await sha256OfStoredFile(file)
    } finally {
      await file.close()
    }
    if (sha256 !== metadata.sha256) {
      await this.remove(id)
      const body = `The ${size} bytes that arrived have another SHA-256 than was promised; they were removed.\n`
      throw {status_code: 422, body}
    }
    const receipt = {id, bytes: size, sha256, verified: true, received: new Date().toISOString(), metadata}
    await writeWhole(this.#receiptPath(id), `${JSON.stringify(receipt, null, 2)}\n`)
  }
}
