/// A host whose management libraries answer like the simulator's, as far as the input does not spoil the answer.
///
/// Of every answer a byte of the input decides what becomes of it: left as it is, another status, bytes of the input
/// over what was written, or another count or length beside it. Behind the input's end all answers are good, so that an
/// empty input is a host without fault and a short one spoils only the first calls.
///
/// Made once a process, in a private host; loads the libraries by the module's own binding. One thread.
#pragma once

#include <string>

#include "fuzz/fuzzing.h"

namespace fuzzing {

/// For LLVMFuzzerInitialize: starts the process anew in its private host, and shows it `scenario`.
void make_spoiled_host(char** argv, const std::string& scenario);

/// From here on answers are spoiled by these bytes, which must live until the next call; null, as at an input's end: by
/// nothing.
void spoil_by(Bytes* bytes);

} // namespace fuzzing
