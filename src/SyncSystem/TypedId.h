// Numbers that name things of one kind and cannot be mistaken for another kind. 0 is invalid; a later id names a later thing.
#pragma once

#include <compare>
#include <cstdint>

namespace KVZ
{

struct IInvalidIdValueZero
{
  static constexpr uint32_t Value = 0;
};

template<class Tag, class InvalidValue = IInvalidIdValueZero>
class ITypedId
{
public:
  constexpr ITypedId() = default;
  constexpr explicit ITypedId( uint32_t i_Value ) : m_Value( i_Value ) {}

  constexpr uint32_t Value() const { return m_Value; }
  constexpr bool IsValid() const { return m_Value != InvalidValue::Value; }
  constexpr auto operator<=>( const ITypedId& ) const = default;

private:
  uint32_t m_Value = InvalidValue::Value;
};

}

namespace SyncSystem_IdTags
{
struct VGlobalSyncSessionId;
struct VCaptureSessionId;
struct VBufferSessionId;
}

namespace KVZ
{
using VGlobalSyncSessionId = ITypedId<SyncSystem_IdTags::VGlobalSyncSessionId>;
using VCaptureSessionId = ITypedId<SyncSystem_IdTags::VCaptureSessionId>;
using VBufferSessionId = ITypedId<SyncSystem_IdTags::VBufferSessionId>;
}
