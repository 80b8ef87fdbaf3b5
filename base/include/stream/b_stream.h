#pragma once

#include "b_api.h"
#include "b_containers.h"
#include "b_hash.h"

#include <atomic>
#include <cstdint>
#include <memory>
#include <string_view>

namespace base {

class Stream;

/// Capability bits of a stream worker: callers test them before an optional operation.
enum StreamCapability : std::uint32_t {
  capRead = 0x1,
  capWrite = 0x2,
  capPosition = 0x4,  ///< setPosition and getPosition
  capSize = 0x8,
  capSetSize = 0x10,
  capMemory = 0x20,    ///< getMemory
  capInMemory = 0x40,  ///< the data lies in memory: no buffering layer goes on top
  capFile = 0x80,
  capSource = 0x100,  ///< getSource
  capReopen = 0x200,
};

/// What each kind of worker offers, named once.
inline constexpr std::uint32_t capsReadOnly = capRead | capPosition | capSize;
inline constexpr std::uint32_t capsReadWrite = capsReadOnly | capWrite | capSetSize;
inline constexpr std::uint32_t capsNull = capsReadWrite | capSource | capReopen;
inline constexpr std::uint32_t capsMemory = capsReadWrite | capMemory | capInMemory;
inline constexpr std::uint32_t capsMemoryView = capsReadOnly | capMemory | capInMemory;
inline constexpr std::uint32_t capsSubStream = capsReadOnly | capMemory;
/// Buffers add what their source offers (its size, its memory access) to these.
inline constexpr std::uint32_t capsBufferedRead = capRead | capPosition | capSource;
inline constexpr std::uint32_t capsBufferedWrite = capWrite | capSource;

/// Flag bits of a stream handle.
enum StreamFlag : std::uint32_t {
  throwOnShortRead = 0x1,
  throwOnShortWrite = 0x2,
  throwOnSkipPastEnd = 0x4,
};

/// Origins of setPosition.
enum SeekOrigin : std::uint32_t { seekBegin = 0, seekCurrent = 1, seekEnd = 2 };

/// A byte source or sink, reference counted by the Stream handles that hold it (the count
/// starts at 1, owned by the handle that a factory returns). This base class is also the
/// null stream: reads and writes report the full count and touch nothing, positions and
/// size are 0, it is always at its end, and its source and reopen are itself.
class BASE1_API StreamWorker : public HostAllocated {
 public:
  StreamWorker(std::uint32_t capabilities, std::string_view name);
  virtual ~StreamWorker();
  StreamWorker(const StreamWorker&) = delete;
  StreamWorker& operator=(const StreamWorker&) = delete;

  /// Direct access: the block holding the data; `offset` receives where the data starts in
  /// it and `size` the byte count. Null when there is none.
  virtual const std::uint8_t* getMemory(std::int64_t* offset, std::int64_t* size);
  virtual std::uint32_t read(void* buffer, std::uint32_t count);
  virtual std::uint32_t write(const void* buffer, std::uint32_t count);
  /// Moves to `offset` from `origin` (SeekOrigin) and returns the new position.
  virtual std::int64_t setPosition(std::int64_t offset, std::uint32_t origin);
  virtual std::int64_t getPosition();
  virtual std::int64_t getSize();
  virtual void setSize(std::int64_t size);
  virtual bool isEOF();
  virtual void flush();
  /// Releases the resource and clears the capability word; runs once, at the end.
  virtual void close();
  virtual Stream getSource();
  virtual Stream reopen();

  std::uint32_t capabilities() const { return m_capabilities; }
  bool has(std::uint32_t bits) const { return (m_capabilities & bits) == bits; }
  const base::string& name() const { return m_name; }
  Hash* hasher() const { return m_hasher.get(); }
  void setHasher(std::unique_ptr<Hash> hasher) { m_hasher = std::move(hasher); }

  void addRef() noexcept { m_count.fetch_add(1, std::memory_order_relaxed); }
  /// Drops one reference; the last one closes the worker (an exception from close is
  /// logged, never thrown), destroys the hasher, then the worker.
  void release() noexcept;
  std::uint32_t refCount() const noexcept { return m_count.load(std::memory_order_relaxed); }

 protected:
  void setCapabilities(std::uint32_t capabilities) { m_capabilities = capabilities; }
  /// A handle on this worker that takes a reference, with default tag and flags.
  Stream self();

 private:
  std::atomic<std::uint32_t> m_count{1};
  std::uint32_t m_capabilities;
  base::string m_name;
  std::unique_ptr<Hash> m_hasher;
};

/// The handle through which every byte source and sink is used. Copying a handle adds a
/// reference to its worker. `tag` is carried along into derived streams (the PLY reader keeps
/// the data's byte order in it); `flags` says which short counts throw.
class BASE1_API Stream {
 public:
  Stream() = default;
  /// Takes over the reference that `worker` was created with.
  static Stream adopt(StreamWorker* worker);

  Stream(const Stream& other);
  Stream(Stream&& other) noexcept;
  Stream& operator=(const Stream& other);
  Stream& operator=(Stream&& other) noexcept;
  ~Stream();

  /// Reads up to `count` bytes; a short read throws when flags bit 0 is set.
  std::uint32_t read(void* buffer, std::uint32_t count);
  /// Writes `count` bytes; a short write throws when flags bit 1 is set.
  std::uint32_t write(const void* buffer, std::uint32_t count);
  /// Moves forward by `count` bytes, seeking when the worker can and reading otherwise;
  /// returns the bytes passed. Stopping early throws when flags bit 2 is set.
  std::uint64_t skip(std::uint64_t count);
  /// Copies the rest of this stream into `destination`; this stream's position is restored
  /// when it can position.
  Stream& operator>>(Stream& destination);
  /// Copies the rest of `source` into this stream.
  Stream& operator<<(Stream& source);
  /// A new, independent stream on the same data (the worker's reopen); an attached hasher is
  /// cloned and reset.
  Stream clone() const;
  /// Drops this handle's reference.
  void reset();

  StreamWorker* worker() const { return m_worker; }
  explicit operator bool() const { return m_worker != nullptr; }
  bool has(std::uint32_t bits) const { return m_worker && m_worker->has(bits); }
  const base::string& name() const;

  std::int64_t getPosition() const { return m_worker->getPosition(); }
  std::int64_t setPosition(std::int64_t offset, std::uint32_t origin = seekBegin) {
    return m_worker->setPosition(offset, origin);
  }
  std::int64_t getSize() const { return m_worker->getSize(); }
  bool isEOF() const { return m_worker->isEOF(); }

  std::uint64_t tag = 0;
  std::uint32_t flags = throwOnSkipPastEnd;

 private:
  StreamWorker* m_worker = nullptr;
};

/// Copies up to `maximum` bytes (all when `maximum` <= 0) from `source` to `destination`;
/// true when everything read was written.
BASE1_API bool copyStream(Stream& destination, Stream& source, std::int64_t maximum = 0);

/// Appends the stream's non-empty lines (split at CR and LF) to `lines`.
BASE1_API void readLines(Stream& stream, base::vector<base::string>& lines);

/// The null stream.
BASE1_API Stream nullStream();

/// An owned memory block of `size` zero bytes; of a copy of `data` (when given); or of the
/// rest of `source`.
BASE1_API Stream memStream(std::int64_t size);
BASE1_API Stream memStream(const void* data, std::int64_t size);
BASE1_API Stream memStream(Stream& source);
/// A read-only view of memory the caller keeps alive; nothing is copied or freed.
BASE1_API Stream memStream(const void* data, std::int64_t size, std::string_view name);
/// A chain of blocks, one per write.
BASE1_API Stream memBlockStream();
/// Streams over a caller's container, which must outlive them; the const ones only read.
BASE1_API Stream vectorStream(base::vector<std::uint8_t>& data);
BASE1_API Stream vectorStream(const base::vector<std::uint8_t>& data);
BASE1_API Stream stringStream(base::string& data);
BASE1_API Stream stringStream(const base::string& data);
/// A window of `length` bytes of `parent` from `offset`, cut at the parent's end. Throws
/// when `offset` lies beyond the parent's size.
BASE1_API Stream subStream(const Stream& parent, std::int64_t offset, std::int64_t length, std::string_view name = {});
/// A read buffer of `bufferSize` bytes over `source` (positions counted from where the
/// source stands now, limited to `length` bytes when `length` > 0). A source whose data is
/// in memory is returned as it is.
BASE1_API Stream bufReadStream(const Stream& source, std::int64_t length, std::uint32_t bufferSize,
                               std::string_view name = {});
/// A write buffer of `bufferSize` bytes over `destination`; pending bytes go out on flush
/// and on close.
BASE1_API Stream bufWriteStream(const Stream& destination, std::uint32_t bufferSize, std::string_view name = {});
/// The decompressed data of gzip (concatenated members too) or zlib data read from `source`.
/// It has no size and no positions; data that ends early or does not decode throws
/// base::zlib_exception naming the stream.
BASE1_API Stream inflateStream(const Stream& source, std::string_view name = {});
/// A read buffer that delivers one byte per read and can step back by one byte.
BASE1_API Stream charStream(const Stream& source, std::uint32_t bufferSize, std::string_view name = {});

}  // namespace base
