#pragma once

#include "b_log.h"
#include "b_stream.h"
#include "ply_format.h"
#include "ply_value.h"

#include <concepts>
#include <cstdint>

namespace ply {

/// What the body reader calls, in this order: `plyElement` once per element in header order
/// (also for a count of 0), true to have its instances delivered; for each delivered instance
/// `beginInstance(i)` before its first property; then `plyProperty` once per property
/// instance, with the values valid only during the call. The reader is a template over the
/// receiver so that the per-property call is inlined, never a virtual call.
///
/// A receiver may also have `bool plyPlan(const Element&, ElementPlan&)`: asked after
/// plyElement said yes, it may fill a plan that tells where each property goes (see
/// ply_plan.h); the reader then moves whole columns into place and calls plyProperty only
/// for the properties the plan leaves to it. False, or a plan that does not cover every
/// property, keeps the per-property calls.
///
/// A receiver may also have `void dropInstance(std::uint32_t)`. It then gets
/// `beginInstance(i)` before every instance that is read one by one (not only delivered
/// ones), and `dropInstance(i)` after such an instance that could not be read whole: an
/// ASCII line that does not parse (the reader skips the line and goes on) or data that ends
/// inside it. Whatever of instance i reached the receiver before, through plyProperty or
/// the plan's arrays and sinks, is the receiver's to undo or keep. Instances read in bulk
/// are always whole.
template <class R>
concept Receiver = requires(R& receiver, const Element& element, const Property& property, const ValueArray& values,
                            std::uint32_t index) {
  { receiver.plyElement(element) } -> std::convertible_to<bool>;
  receiver.beginInstance(index);
  receiver.plyProperty(element, property, values);
};

/// Reads a PLY header from `stream` into the empty `header`. True when end_header was
/// reached; the stream is then at the body's first byte (when it can position), and for a
/// binary body its tag carries the byte order: low half the data's, high half the
/// machine's (0 little-endian, 1 big-endian). Every failure is logged with its cause.
bool parseHeader(Header& header, base::Stream& stream);

}  // namespace ply

#include "ply_ascii_body.h"
#include "ply_binary_body.h"

namespace ply {

/// How a read ended.
enum class ReadResult { complete, headerFailed, bodyEndedEarly };

/// Reads the header and then the whole body of the PLY file that `stream` is positioned at,
/// delivering every property instance to `receiver`. A body that ends early keeps what was
/// delivered, delivers nothing past the end, and logs a warning naming the element and the
/// instances read. Exceptions from the receiver propagate.
template <Receiver R>
ReadResult readFile(Header& header, base::Stream& stream, R& receiver) {
  base::log().message(base::logScene, base::logDebug, "Begin parsing the ply file.");
  ByteWindow window(stream);
  if (!detail::parseHeader(header, window, stream)) {
    base::log().message(base::logScene, base::logDebug, "Header parsing error!");
    return ReadResult::headerFailed;
  }
  base::log().message(base::logScene, base::logDebug, "Begin parsing the ply elements.");
  bool complete = true;
  if (header.encoding == Encoding::ascii) {
    complete = detail::AsciiBody(window).read(header, receiver);
  } else {
    const bool swap = (stream.tag & 0xffffffffu) != (stream.tag >> 32);
    complete = swap ? detail::BinaryBody<true>(window).read(header, receiver)
                    : detail::BinaryBody<false>(window).read(header, receiver);
    if (!complete) return ReadResult::bodyEndedEarly;
  }
  base::log().message(base::logScene, base::logDebug, "End parsing the ply elements");
  base::log().message(base::logScene, base::logDebug, "End parsing the ply file.");
  return complete ? ReadResult::complete : ReadResult::bodyEndedEarly;
}

/// readFile with a plain answer: false when the header fails or a binary body ends early;
/// an ASCII body that ends early still counts as read.
template <Receiver R>
bool parseFile(Header& header, base::Stream& stream, R& receiver) {
  const ReadResult result = readFile(header, stream, receiver);
  return result == ReadResult::complete || (result == ReadResult::bodyEndedEarly && header.encoding == Encoding::ascii);
}

}  // namespace ply
