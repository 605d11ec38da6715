// A data source's captures: ranges of global ticks turned into ranges of the buffer.
#include "SyncSystem/DataSource.h"

#include <boost/thread/lock_guard.hpp>

namespace SyncSystem
{

using KVZ::VCaptureSessionId;
using KVZ::VTick;

namespace
{

constexpr uint32_t BusyStates = 28;

VToken LastBefore( const VGlobalSyncSessionInfo& i_rInfo, VTick i_End )
{
  VToken Token = i_rInfo.PositionAtOrAfter( i_End );
  --Token.m_FrameNumber;
  return Token;
}

bool IsBusy( uint32_t i_State ) { return ( i_State & BusyStates ) != 0; }

bool IsTime( VTick i_Tick ) { return i_Tick.IsValid() && !i_Tick.IsOpen(); }

// The source's clocks, and all others, at a global tick.
KVZ::ITickInClocks ReadingsAt( const VGlobalSyncSessionInfo& i_rInfo, VTick i_Global )
{
  return KVZ::Shifted( i_rInfo.m_StartTicks, i_Global - i_rInfo.LiveStart() );
}

}

bool VDataSource::StartCapture( const KVZ::ICaptureHeader& i_rHeader, VTick i_Start, VTick i_End, bool i_bReserve, uint32_t i_Options )
{
  const VCaptureCall Call{ i_rHeader, i_Start, i_End, i_bReserve ? CaptureSessionType::Reservation : CaptureSessionType::Streamed, i_Options };
  return OnStrand( [this, Call] { return Begin( Call ); } );
}

bool VDataSource::Begin( const VCaptureCall& i_rCall )
{
  const KVZ::ICaptureHeader& rHeader = i_rCall.m_Header;
  const VCaptureSessionId Id = rHeader.m_CaptureSessionId;
  if( !IsAdmitted( Id ) )
  {
    return false;
  }
  const VInfoPtr pInfo = FindInfo( rHeader.m_GlobalSyncSessionId );
  const VCaptureRange Range = pInfo ? MakeRange( *pInfo, i_rCall.m_Start, i_rCall.m_End ) : VCaptureRange();
  const bool bWasCurrent = CurrentCapture().m_Id == Id;
  VCaptureRequest Request;
  Request.m_Id = Id;
  Request.m_Type = i_rCall.m_Type;
  Request.m_Info = { Id, rHeader.m_Name, rHeader.m_Info, i_rCall.m_Options };
  Request.m_Start = Range.m_Start;
  Request.m_End = Range.m_End;

  bool bReady = Range.m_Start.IsValid();
  if( bReady )
  {
    LogStart( *pInfo, i_rCall, Range.m_Start );
    bReady = Prepare( i_rCall, pInfo, Request );
  }
  else
  {
    Request.m_Failure = ECaptureFailure::StartLost;
  }
  const auto TellStarted = [&]
  { OnCaptureStarted( rHeader, m_CounterClock, Range.m_StartTicks, Range.m_EndTicks, i_rCall.m_Type == CaptureSessionType::Reservation ); };
  if( bReady && !bWasCurrent )
  {
    TellStarted();
  }
  if( !( bReady ? m_pBuffer->StartCapture( Request ) : m_pBuffer->FailCapture( Request ) ) )
  {
    return false;
  }
  RememberCapture( Id, pInfo, i_rCall.m_Start );
  if( bReady && bWasCurrent )
  {
    TellStarted();
  }
  if( bReady && i_rCall.m_Type == CaptureSessionType::Reservation )
  {
    LogReserved( *pInfo );
  }
  return true;
}

// What the buffer would refuse must not reach BeginCapture, which lets go of the files of the capture before.
bool VDataSource::IsAdmitted( VCaptureSessionId i_Id ) const
{
  VCaptureSessionStatus Status;
  if( !i_Id.IsValid() || !m_pBuffer->Status( Status ) )
  {
    return i_Id.IsValid();
  }
  const bool bNotBegun = ( Status.m_State & ( ECaptureState::Idle | ECaptureState::WaitingForStart ) ) != 0;
  const bool bOver = ( Status.m_State & ( ECaptureState::Idle | ECaptureState::Complete | ECaptureState::Cancelled ) ) != 0;
  return i_Id == Status.m_CaptureSessionId ? bNotBegun || Status.m_CaptureType == CaptureSessionType::Reservation : bOver;
}

// A reservation has nothing to prepare; the capture that it turns into does.
bool VDataSource::Prepare( const VCaptureCall& i_rCall, const VInfoPtr& i_pInfo, VCaptureRequest& io_rRequest )
{
  bool bReady = true;
  if( i_rCall.m_Type == CaptureSessionType::Streamed && m_PreparedCapture != io_rRequest.m_Id )
  {
    m_PreparedCapture = io_rRequest.m_Id;
    bReady = BeginCapture( i_rCall.m_Header, i_pInfo, i_rCall.m_Options, io_rRequest.m_Errors );
    if( !bReady )
    {
      m_PreparedCapture = {};   // another try with this id prepares anew
    }
  }
  if( !bReady || !io_rRequest.m_Errors.empty() )
  {
    io_rRequest.m_Failure |= ECaptureFailure::ReportedErrors;
  }
  return bReady;
}

VDataSource::VCaptureRange VDataSource::MakeRange( const VGlobalSyncSessionInfo& i_rInfo, VTick i_Start, VTick i_End )
{
  VCaptureRange Range;
  if( !i_rInfo.HasPositions() || !IsTime( i_Start ) )
  {
    return Range;
  }
  Range.m_Start = i_rInfo.PositionAtOrAfter( i_Start );
  Range.m_StartTicks = ReadingsAt( i_rInfo, i_Start );
  if( IsTime( i_End ) )
  {
    Range.m_End = LastBefore( i_rInfo, i_End );
    Range.m_EndTicks = ReadingsAt( i_rInfo, i_End );
  }
  return Range;
}

void VDataSource::LogStart( const VGlobalSyncSessionInfo& i_rInfo, const VCaptureCall& i_rCall, const VToken& i_rPosition ) const
{
  const bool bReserve = i_rCall.m_Type == CaptureSessionType::Reservation;
  VToken First;
  if( bReserve && m_pBuffer->GetFirstToken( i_rPosition.m_BufferSession, First ) )
  {
    KVZ_LOG( m_rLog, 5, "Attempting to reserve capture from buffer entry %1% (First entry is %2%)", i_rPosition.m_FrameNumber, First.m_FrameNumber );
  }
  VToken Newest;
  VTick NewestTick;
  if( !m_pBuffer->GetNewestToken( Newest ) || !i_rInfo.TickAt( Newest, NewestTick ) )
  {
    return;
  }
  const int64_t LocalTick = ( i_rCall.m_Start - i_rInfo.m_CounterStart ).Count();
  const int64_t LatestTick = ( NewestTick - i_rInfo.m_CounterStart ).Count();
  if( bReserve )
  {
    KVZ_LOG( m_rLog, 5, "StartCapture: Reserving from Local Tick %1%. (Lastest tick is %2%)", LocalTick, LatestTick );
  }
  else
  {
    KVZ_LOG( m_rLog, 5, "StartCapture: Local Start Tick is %1%. (Lastest tick is %2%)", LocalTick, LatestTick );
  }
}

void VDataSource::LogReserved( const VGlobalSyncSessionInfo& i_rInfo ) const
{
  VCaptureSessionStatus Status;
  VTick Start;
  if( m_pBuffer->Status( Status ) && i_rInfo.TickAt( Status.m_Start, Start ) )
  {
    KVZ_LOG( m_rLog, 5, "Reserved capture from tick %1% (buffer entry %2%)", Start.Count(), Status.m_Start.m_FrameNumber );
  }
}

void VDataSource::RememberCapture( VCaptureSessionId i_Id, VInfoPtr i_pInfo, VTick i_RequestedStart )
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  m_Capture = { i_Id, std::move( i_pInfo ), {} };
  m_Capture.m_LastStatus.m_RequestedStart = i_RequestedStart;
}

VDataSource::VCaptureState VDataSource::CurrentCapture() const
{
  boost::lock_guard<boost::mutex> Lock( m_Mutex );
  return m_Capture;
}

void VDataSource::EndCapture( VTick i_End )
{
  const VCaptureState Capture = CurrentCapture();
  if( !Capture.m_pInfo || !Capture.m_pInfo->HasPositions() || !i_End.IsValid() )
  {
    return;
  }
  VCaptureEnd End;
  if( !i_End.IsOpen() )
  {
    End.m_End = LastBefore( *Capture.m_pInfo, i_End );
  }
  else
  {
    End.m_End = NewestPosition();
  }
  if( !m_pBuffer->SetCaptureEnd( Capture.m_Id, End ) )
  {
    return;   // it is over, or a new session has ended it
  }

  VTick EndTick = i_End;
  if( i_End.IsOpen() && !Capture.m_pInfo->TickAt( End.m_End, EndTick ) )
  {
    return;
  }
  OnStrand( [this, Capture, EndTick] { OnCaptureEndChanged( Capture.m_Id, m_CounterClock, ReadingsAt( *Capture.m_pInfo, EndTick ) ); } );
}

void VDataSource::CancelCapture()
{
  const VCaptureSessionId Id = CurrentCapture().m_Id;
  if( Id.IsValid() )
  {
    m_pBuffer->CancelCapture( Id );
    OnStrand( [this, Id] { OnCaptureCancelled( Id ); } );
  }
}

KVZ::ICaptureStatus VDataSource::GetCaptureStatus()
{
  const KVZ::ICaptureStatus Status = ReadCaptureStatus();
  UpdateBusy( Status.m_State );
  return Status;
}

KVZ::ICaptureStatus VDataSource::ReadCaptureStatus()
{
  const VCaptureState Capture = CurrentCapture();
  KVZ::ICaptureStatus Status = Capture.m_LastStatus;
  VCaptureSessionStatus Buffer;
  if( !Capture.m_Id.IsValid() || !m_pBuffer->Status( Buffer ) || Buffer.m_CaptureSessionId != Capture.m_Id )
  {
    return Status;   // none, or the next one is just being started
  }
  FillStatus( Buffer, Capture.m_pInfo.get(), Status );
  if( Status.m_State == ECaptureState::Cancelled && IsCaptureDraining() )
  {
    Status.m_State = ECaptureState::Cancelling;
  }
  {
    boost::lock_guard<boost::mutex> Lock( m_Mutex );
    if( m_Capture.m_Id == Capture.m_Id )
    {
      m_Capture.m_LastStatus = Status;
    }
  }
  return Status;
}

void VDataSource::FillStatus( const VCaptureSessionStatus& i_rBuffer, const VGlobalSyncSessionInfo* i_pInfo, KVZ::ICaptureStatus& io_rStatus ) const
{
  io_rStatus.m_State = i_rBuffer.m_State;
  io_rStatus.m_Failure = i_rBuffer.m_Failure;
  io_rStatus.m_Errors.clear();
  for( const VCaptureError& rError : i_rBuffer.m_Errors )
  {
    io_rStatus.m_Errors.push_back( rError.m_Text );
  }
  io_rStatus.m_BufferFill = BufferFill();
  if( !i_pInfo || !i_pInfo->HasPositions() )
  {
    return;
  }
  const VTick Period = i_pInfo->m_Session.m_Period;
  io_rStatus.m_Start = VTick::Open();
  i_pInfo->TickAt( i_rBuffer.m_Start, io_rStatus.m_Start );
  int64_t Frames = 0;
  const bool bWhole = VCaptureBuffer::Distance( i_rBuffer.m_Start, i_rBuffer.m_End, Frames );
  io_rStatus.m_CapturedDuration = bWhole ? Period * ( Frames + 1 ) : VTick::Open();
  io_rStatus.m_AvailableDuration = Period * static_cast<int64_t>( i_rBuffer.m_AvailableFrames );
}

double VDataSource::BufferFill() const
{
  double Total = 0.0;
  double Used = 0.0;
  m_pBuffer->Allocator().GetMemoryStats( Total, Used );
  return Total > 0.0 ? Used / Total : 0.0;
}

// Whoever asks for the status may find a change. What is told is read anew on the strand, where no older report can overtake a newer one.
void VDataSource::UpdateBusy( uint32_t i_State )
{
  if( IsBusy( i_State ) != m_bBusyTold )
  {
    PostToStrand(
      [pWeak = KVZ::WeakFrom( this )]
      {
        if( const auto pThis = pWeak.lock() )
        {
          pThis->TellBusy();
        }
      } );
  }
}

void VDataSource::TellBusy()
{
  const bool bBusy = IsBusy( ReadCaptureStatus().m_State );
  if( m_bBusyTold.exchange( bBusy ) != bBusy )
  {
    OnBusyChanged( bBusy );
  }
}

}
