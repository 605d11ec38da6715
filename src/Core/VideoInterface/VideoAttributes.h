// Named, typed values that describe a recording: an ordered map from key to value, stored by every writer in its own way.
#pragma once

#include "Core/VideoInterface/Streams.h"

#include <cstdint>
#include <map>
#include <memory>
#include <string>

namespace KVZ
{

class IVideoAttributes
{
public:
  class IValue
  {
  public:
    IValue() = default;
    IValue( const IValue& ) = delete;
    IValue& operator=( const IValue& ) = delete;

    // The same concrete type and an equal value.
    virtual bool IsEqual( const IValue& i_rOther ) const = 0;
    // The number that stands before the value on disk: 0 bool, 1 int8, 2 int16, 3 int32, 4 int64, 5 to 8 the unsigned forms, 9 float,
    // 10 double, 11 string.
    virtual uint32_t GetTypeTag() const = 0;
    // The tag as four bytes, then the value, little-endian; a string is its length as uint32 and its bytes. False as soon as a write
    // fails, and for a string of 4 GiB or more.
    virtual bool Write( IOutputStream& o_rStream ) const = 0;
    virtual ~IValue() = default;
  };

  using VMap = std::map<std::string, std::shared_ptr<const IValue>>;

  // T is one of the twelve types above (char stands for int8). Set replaces any old value. Get is false, leaving its output alone, when the
  // key is absent or the value is of another type.
  template<class T>
  void Set( const std::string& i_rKey, const T& i_rValue );
  template<class T>
  bool Get( const std::string& i_rKey, T& o_rValue ) const;
  void Set( const std::string& i_rKey, const char* i_pValue ) { Set( i_rKey, std::string( i_pValue ) ); }

  bool Has( const std::string& i_rKey ) const { return m_Values.count( i_rKey ) != 0; }
  // In ascending byte order of the keys.
  const VMap& Values() const { return m_Values; }

  bool operator==( const IVideoAttributes& i_rOther ) const;

private:
  VMap m_Values;
};

}
