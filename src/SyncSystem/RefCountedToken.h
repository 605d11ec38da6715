// A pinned position: while it points to a frame, the frame can neither be freed nor changed, even when its session has left the buffer, and
// the buffer stays alive. Each object is for one thread at a time; different ones may be used on different threads.
#pragma once

#include "SyncSystem/CaptureTypes.h"

#include <memory>

namespace SyncSystem
{

class VCaptureBuffer;

class VRefCountedToken
{
public:
  VRefCountedToken() = default;
  VRefCountedToken( const VRefCountedToken& i_rOther );
  VRefCountedToken( VRefCountedToken&& io_rOther ) noexcept;
  VRefCountedToken& operator=( VRefCountedToken i_Other ) noexcept;
  ~VRefCountedToken();

  // Unpins.
  void Clear();

  explicit operator bool() const { return m_Token.m_pFrame != nullptr; }
  // Null for an empty token.
  VFrameEntry* Frame() const { return m_Token.m_pFrame; }
  const VToken& Token() const { return m_Token; }

private:
  friend class VCaptureBuffer;

  // The frame is pinned already.
  VRefCountedToken( std::shared_ptr<VCaptureBuffer> i_pBuffer, const VToken& i_rPinned );

  VToken m_Token;
  std::shared_ptr<VCaptureBuffer> m_pBuffer;
};

}
