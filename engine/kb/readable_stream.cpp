#include "engine/kb/readable_stream.h"

namespace ap {

EntryTextStream::EntryTextStream(std::shared_ptr<ReadableFileI> entry) {
  open(ReadableDevice_Tmpl<char>(std::make_shared<ReadableWTell>(std::move(entry))), kBufferSize,
       kPutbackSize);
  exceptions(std::ios_base::badbit);
}

}  // namespace ap
