// What a completed write survives.
#pragma once

namespace appsync::device {

/// `process`: a crash of the process. `power`: a power failure too, which costs waiting for the disk. Neither ever
/// leaves part of a write.
enum class Durability { process, power };

}  // namespace appsync::device
