#include "call_failure.h"

#include "b_exception.h"
#include "raw_ply.h"

#include <fmt/format.h>

#include <new>

namespace pymeshport {

std::string fileMessage(const std::string& path, std::string_view text) {
  if (text.starts_with(path + ": ")) return std::string(text);
  return fmt::format("{}: {}", path, text);
}

CallFailure failureOf(std::exception_ptr thrown, const std::string& path, const std::string& cause) {
  using Kind = CallFailure::Kind;
  try {
    std::rethrow_exception(thrown);
  } catch (const CallError& error) {
    return error.failure();
  } catch (const base::fs::file_not_found&) {
    return {Kind::notFound, fileMessage(path, "no such file")};
  } catch (const ReadError& error) {
    return {Kind::corrupt, fileMessage(path, cause.empty() ? error.what() : cause)};
  } catch (const base::zlib_exception& error) {
    return {Kind::corrupt, fileMessage(path, error.what())};
  } catch (const base::invalid_argument& error) {
    return {Kind::error, fileMessage(path, error.argument())};
  } catch (const base::api_exception& error) {
    return {Kind::error, fileMessage(path, "cannot open the file: " + base::systemErrorText(error.errorCode()))};
  } catch (const base::exception& error) {
    // What is left is the readers' own: the file's content stopped them.
    return {Kind::corrupt, fileMessage(path, cause.empty() ? error.what() : cause)};
  } catch (const std::bad_alloc&) {
    return {Kind::outOfMemory, fileMessage(path, "out of memory")};
  } catch (const std::exception& error) {
    return {Kind::error, fileMessage(path, cause.empty() ? error.what() : cause)};
  }
}

}  // namespace pymeshport
