// A stream on something that has to be closed, and that may report only then what it could not store.
#pragma once

#include "Core/VideoInterface/Streams.h"

namespace UtilsIO
{

class IClosableStream : public KVZ::IStreamSeekable
{
public:
  // False if it was not open, or if what was written could not be stored.
  virtual bool Close() = 0;
};

}
