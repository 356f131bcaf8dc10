// The length a WAV or AIFF header announces. libsndfile trims its frame
// count to what the file holds, which hides a truncated file.
#ifndef CLIPWEAVER_TOOLS_ANNOUNCED_LENGTH_H_
#define CLIPWEAVER_TOOLS_ANNOUNCED_LENGTH_H_

#include <cstdint>

namespace cwtool {

// Frames announced by the header of the file open on fd, or -1 where the
// format is another or the header leaves the length open.
int64_t AnnouncedFrames(int fd);

}  // namespace cwtool

#endif  // CLIPWEAVER_TOOLS_ANNOUNCED_LENGTH_H_
