// File containers. Values are stored in settings.
#pragma once

#include <cstdint>
#include <string>

namespace KVZ
{

class IVideoContainer
{
public:
  enum Enum : int32_t
  {
    EMOV = 0,
    EMP4 = 1,
    EAVI = 2,
    ETVID = 3,
    EMKV = 4,
    EIMAGES = 5,
  };
};

constexpr int32_t VideoContainerCount = 6;

// The extension of the container's files without the dot ("mov", "mp4", "avi", "tvid", "mkv"); for image sequences, and for a value
// outside the table, empty: the payload decides there.
const char* GetFileExtension( IVideoContainer::Enum i_Container );

// The enumerator's name; empty for a value outside the table.
std::string ToName( IVideoContainer::Enum i_Value );
bool FromName( const std::string& i_rName, IVideoContainer::Enum& o_rValue );

}
