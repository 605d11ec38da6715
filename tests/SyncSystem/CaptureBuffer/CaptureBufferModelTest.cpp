// Seeded random commands on a buffer and on its model, compared after every one.
#include "tests/SyncSystem/CaptureBuffer/CaptureBufferModel.h"

#include "tests/support/FrameMemory.h"
#include "tests/support/ManualPostalService.h"

#include <gtest/gtest.h>

#include <map>
#include <memory>
#include <random>
#include <vector>

namespace
{

using namespace SyncSystem;
using TestSupport::NumberedPayload;
using VPosition = VCaptureBufferModel::VPosition;

VPosition ToPosition( const VToken& i_rToken ) { return { i_rToken.m_BufferSession.Value(), i_rToken.m_FrameNumber }; }
VToken ToToken( VPosition i_Position ) { return { KVZ::VBufferSessionId( i_Position.m_Session ), i_Position.m_Number, nullptr }; }

struct VScenario
{
  unsigned m_Seed;
  size_t m_Blocks;
  size_t m_FramesPerBlock;
  int m_Steps;
};

class VRandomRun
{
public:
  explicit VRandomRun( const VScenario& i_rScenario )
    : m_Random( i_rScenario.m_Seed ),
      m_Memory( i_rScenario.m_Blocks, i_rScenario.m_FramesPerBlock ),
      m_Model( i_rScenario.m_Blocks, i_rScenario.m_FramesPerBlock ),
      m_pBuffer(
        VCaptureBuffer::Make<TestSupport::VNumberedCaptureBuffer>( TestSupport::VNumberedCaptureBuffer::Settings( m_Memory, m_pPostalService ) ) )
  {
    m_pBuffer->StatusCallback().Add( [this]( const VCaptureSessionStatus& i_rStatus ) { OnStatus( i_rStatus ); } );
    m_pBuffer->NewDataCallback().Add( [this]( KVZ::VBufferSessionId ) { ++m_NewData; } );
    m_pBuffer->BufferSessionRemovedCallback().Add( [this]( KVZ::VBufferSessionId i_Id ) { m_Removed.push_back( i_Id.Value() ); } );
    m_pBuffer->CaptureReadyCallback().Add(
      [this]( KVZ::VCaptureSessionId, CaptureSessionType::Enum, const VCaptureSessionInfo&, const VToken& i_rStart, const VToken& i_rEnd )
      {
        m_ReadyStart = ToPosition( i_rStart );
        m_ReadyEnd = ToPosition( i_rEnd );
      } );
    if( Chance( 3 ) ) m_Model.m_DrainLimit = Pick( 4 );
    m_pBuffer->SetDataDrainLimit( m_Model.m_DrainLimit );
  }
  ~VRandomRun()
  {
    for( const auto& [Id, pReader] : m_Readers ) m_pBuffer->UnregisterClient( Id );
  }
  VRandomRun( const VRandomRun& ) = delete;
  VRandomRun& operator=( const VRandomRun& ) = delete;

  void Step()
  {
    static const std::vector<std::pair<void ( VRandomRun::* )(), double>> Commands = { { &VRandomRun::Add, 50 }, { &VRandomRun::NewSession, 1.5 },
      { &VRandomRun::Start, 10 }, { &VRandomRun::SetEnd, 4 }, { &VRandomRun::Cancel, 1.5 }, { &VRandomRun::Register, 1.5 },
      { &VRandomRun::Unregister, 0.7 }, { &VRandomRun::ReadAsClient, 25 }, { &VRandomRun::FinishAsClient, 1 }, { &VRandomRun::PinSomewhere, 6 },
      { &VRandomRun::Unpin, 6 }, { &VRandomRun::Walk, 5 } };
    std::vector<double> Weights;
    Weights.reserve( Commands.size() );
    for( const auto& [pCommand, Weight] : Commands ) Weights.push_back( Weight );
    ( this->*Commands[std::discrete_distribution<size_t>( Weights.begin(), Weights.end() )( m_Random )].first )();
    m_pPostalService->RunAll();
    Compare();
  }

private:
  struct VPin
  {
    VRefCountedToken m_Frame;
    size_t m_Block = 0;
  };

  struct VReader : VPin
  {
    int m_Notified = 0;
    bool m_bAsleep = true;
    bool m_bToldFinished = false;
  };

  size_t Pick( size_t i_Bound ) { return std::uniform_int_distribution<size_t>( 0, i_Bound - 1 )( m_Random ); }
  bool Chance( size_t i_OneIn ) { return Pick( i_OneIn ) == 0; }

  // Somewhere in, before or after what the buffer holds.
  VPosition PickPosition()
  {
    if( Chance( 10 ) ) return {};
    const uint32_t Newest = m_Model.m_Current;
    const uint32_t Session = Chance( 2 ) ? Newest : static_cast<uint32_t>( std::max<int64_t>( 1, Newest + 1 - static_cast<int64_t>( Pick( 4 ) ) ) );
    const VCaptureBufferModel::VSession* pSession = m_Model.FindSession( Session );
    const int64_t Low = pSession ? m_Model.Low( *pSession ) : m_Model.m_Last + 1;
    const int64_t High = pSession ? m_Model.High( *pSession ) : m_Model.m_Last;
    return { Session, Low - 3 + static_cast<int64_t>( Pick( static_cast<size_t>( High - Low + 10 ) ) ) };
  }

  // The same as a token, often one that was found long ago and still holds a pointer.
  VToken PickToken()
  {
    if( !m_OldTokens.empty() && Chance( 4 ) ) return m_OldTokens[Pick( m_OldTokens.size() )];
    return ToToken( PickPosition() );
  }

  uint32_t PickId() { return Chance( 6 ) ? static_cast<uint32_t>( Pick( m_Model.m_Id + 3 ) ) : m_Model.m_Id; }

  void Add()
  {
    for( size_t Frame = Pick( 6 ); Frame > 0; --Frame )
    {
      const bool bAdded = m_Model.Add();
      const VToken Token = m_pBuffer->Add();
      ASSERT_EQ( Token.IsValid(), bAdded );
      if( !bAdded ) return;
      ++m_Added;
      ASSERT_EQ( ToPosition( Token ), ( VPosition{ m_Model.m_Current, m_Model.m_Last } ) );
    }
  }

  void NewSession()
  {
    m_Model.NewSession();
    ASSERT_EQ( ToPosition( m_pBuffer->StartNewBufferSession() ), ( VPosition{ m_Model.m_Current, m_Model.m_Last + 1 } ) );
  }

  void Start()
  {
    const VToken StartToken = PickToken();
    VToken EndToken = PickToken();
    if( Chance( 3 ) ) EndToken = {};
    if( Chance( 2 ) && EndToken.IsValid() )
      EndToken = { StartToken.m_BufferSession, StartToken.m_FrameNumber + static_cast<int64_t>( Pick( 12 ) ), nullptr };
    VCaptureBufferModel::VRequest Request{ Chance( 4 ) ? PickId() : m_Model.m_Id + 1, !Chance( 4 ), ToPosition( StartToken ), ToPosition( EndToken ),
      Chance( 5 ) ? uint32_t{ ECaptureFailure::ReportedErrors } : 0 };
    const KVZ::VCaptureSessionId Id( Request.m_Id );
    const VCaptureRequest Real{ Id, Request.m_bStreamed ? CaptureSessionType::Streamed : CaptureSessionType::Reservation, { Id, {}, 0, 0 },
      StartToken, EndToken, Request.m_Failure, {} };
    ASSERT_EQ( m_pBuffer->StartCapture( Real ), m_Model.Start( Request ) );
  }

  void SetEnd()
  {
    const uint32_t Id = PickId();
    const VToken End = Chance( 3 ) ? ToToken( { m_Model.m_Current, m_Model.m_Last + static_cast<int64_t>( Pick( 5 ) ) } ) : PickToken();
    const uint32_t Failure = Chance( 4 ) ? uint32_t{ ECaptureFailure::MemoryExhausted } : 0;
    ASSERT_EQ( m_pBuffer->SetCaptureEnd( KVZ::VCaptureSessionId( Id ), { End, Failure } ), m_Model.SetEnd( Id, ToPosition( End ), Failure ) );
  }

  void Cancel()
  {
    const uint32_t Id = PickId();
    ASSERT_EQ( m_pBuffer->CancelCapture( KVZ::VCaptureSessionId( Id ) ), m_Model.Cancel( Id ) );
  }

  void Register()
  {
    if( m_Readers.size() == 3 ) return;
    const auto pReader = std::make_shared<VReader>();
    const uint32_t Id = m_pBuffer->RegisterClient( [pReader] { ++pReader->m_Notified; } );
    ASSERT_TRUE( Id > 0 && m_Readers.emplace( Id, pReader ).second );
    m_Model.Register( Id );
  }

  void Unregister()
  {
    if( m_Readers.empty() ) return;
    const auto Reader = PickReader();
    ASSERT_TRUE( m_pBuffer->UnregisterClient( Reader->first ) );
    ASSERT_FALSE( m_pBuffer->UnregisterClient( Reader->first ) );
    ReleaseFrame( *Reader->second );
    m_Model.Unregister( Reader->first );
    m_Readers.erase( Reader );
  }

  std::map<uint32_t, std::shared_ptr<VReader>>::iterator PickReader()
  {
    return std::next( m_Readers.begin(), static_cast<std::ptrdiff_t>( Pick( m_Readers.size() ) ) );
  }

  void ReleaseFrame( VReader& i_rReader )
  {
    if( i_rReader.m_Frame ) m_Model.Unpin( i_rReader.m_Block );
    i_rReader.m_Frame.Clear();
  }

  // Reads some frames, or all.
  void ReadAsClient()
  {
    if( m_Readers.empty() ) return;
    const auto& [Id, pReader] = *PickReader();
    size_t Reads = 1 + Pick( 8 );
    do {
      ReadOne( Id, *pReader );
    } while( --Reads > 0 && !pReader->m_bAsleep );
  }

  // A reader goes to sleep only when it has been told to; after the first Finished it asks once more.
  void ReadOne( uint32_t i_Id, VReader& io_rReader )
  {
    ReleaseFrame( io_rReader );
    VClientRead Read;
    ASSERT_TRUE( m_pBuffer->ClientNextFrame( i_Id, io_rReader.m_Frame, Read ) );
    const auto Expected = m_Model.Next( i_Id );
    ASSERT_EQ( Read.m_Result, Expected.m_Result );
    ASSERT_EQ( io_rReader.m_Frame.Token().m_FrameNumber, Expected.m_Frame );
    if( io_rReader.m_Frame )
    {
      ASSERT_TRUE( m_Model.Find( ToPosition( io_rReader.m_Frame.Token() ), io_rReader.m_Block ) );
      m_Model.Pin( io_rReader.m_Block );
    }
    io_rReader.m_bToldFinished = Read.m_Result == EClientResult::Finished && !io_rReader.m_bToldFinished;
    io_rReader.m_bAsleep = Read.m_Result != EClientResult::MoreToCome && !io_rReader.m_bToldFinished;
    io_rReader.m_Notified = 0;
  }

  void FinishAsClient()
  {
    if( m_Readers.empty() ) return;
    const auto& [Id, pReader] = *PickReader();
    const bool bLast = Chance( 2 );
    ASSERT_TRUE( m_pBuffer->ClientFinished( Id, ECaptureFailure::ReportedErrors, VCaptureError{ Id, "failed" }, bLast ) );
    m_Model.Finish( Id, ECaptureFailure::ReportedErrors, bLast );
    if( bLast ) ReadOne( Id, *pReader );   // and is told to wait
  }

  void PinSomewhere()
  {
    VToken Token = PickToken();
    VPin Pin;
    const bool bThere = m_Model.Find( ToPosition( Token ), Pin.m_Block );
    ASSERT_EQ( m_pBuffer->Read( Token, Pin.m_Frame ), bThere );
    if( !bThere ) return;
    m_OldTokens.push_back( Token );
    m_Model.Pin( Pin.m_Block );
    if( Chance( 2 ) && !m_Pins.empty() ) m_Pins.front().m_Frame = VRefCountedToken( m_Pins.front().m_Frame );
    m_Pins.push_back( std::move( Pin ) );
  }

  void Unpin()
  {
    if( m_Pins.empty() ) return;
    std::swap( m_Pins[Pick( m_Pins.size() )], m_Pins.back() );
    m_Model.Unpin( m_Pins.back().m_Block );
    m_Pins.pop_back();
  }

  void Walk()
  {
    VToken Token = PickToken();
    const VToken Before = Token;
    const int64_t Frames = static_cast<int64_t>( Pick( 20 ) ) - 10;
    m_pBuffer->Advance( Token, Frames );
    ASSERT_EQ( Token.m_FrameNumber, Before.m_FrameNumber + Frames );
    size_t Block = 0;
    if( Token.m_pFrame )
    {
      ASSERT_TRUE( m_Model.Find( ToPosition( Token ), Block ) && Token.m_pFrame->m_FrameNumber == Token.m_FrameNumber );
    }
    int64_t Distance = 0;
    ASSERT_EQ( VCaptureBuffer::Distance( Before, Token, Distance ), Before.IsValid() );
    if( Before.IsValid() )
    {
      ASSERT_EQ( Distance, Frames );
    }
  }

  void OnStatus( const VCaptureSessionStatus& i_rStatus )
  {
    m_LastToldState = i_rStatus.m_State;
    m_LastToldFailure = i_rStatus.m_Failure;
  }

  void Compare()
  {
    CompareFrames();
    CompareCapture();
    CompareClients();
    ASSERT_EQ( m_Memory.m_pClient->GetHeldBlocks(), m_Model.HeldBlocks() );
    ASSERT_EQ( m_NewData, m_Added );
    ASSERT_EQ( m_Removed, m_Model.m_RemovedSessions );
    for( const VPin& rPin : m_Pins ) ASSERT_TRUE( NumberedPayload( rPin.m_Frame.Frame() ).Holds( rPin.m_Frame.Token().m_FrameNumber ) );
  }

  void CompareFrames()
  {
    std::vector<uint32_t> Expected;
    for( const auto& [Id, rSession] : m_Model.m_Sessions )
    {
      if( rSession.m_Frames.empty() ) continue;
      Expected.push_back( Id );
      VToken First, Last;
      ASSERT_TRUE( m_pBuffer->GetFirstToken( KVZ::VBufferSessionId( Id ), First ) && m_pBuffer->GetLastToken( KVZ::VBufferSessionId( Id ), Last ) );
      ASSERT_EQ( First.m_FrameNumber, rSession.m_Frames.front().m_Number );
      ASSERT_EQ( Last.m_FrameNumber, rSession.m_Frames.back().m_Number );
      ASSERT_TRUE( NumberedPayload( First.m_pFrame ).Holds( First.m_FrameNumber ) && NumberedPayload( Last.m_pFrame ).Holds( Last.m_FrameNumber ) );
    }
    std::vector<KVZ::VBufferSessionId> Sessions;
    ASSERT_EQ( m_pBuffer->GetBufferSessions( Sessions ), Expected.size() );
    for( size_t Session = 0; Session < Expected.size(); ++Session ) ASSERT_EQ( Sessions[Session].Value(), Expected[Session] );
  }

  void CompareCapture()
  {
    VCaptureSessionStatus Status;
    ASSERT_EQ( m_pBuffer->Status( Status ), m_Model.m_Id != 0 );
    ASSERT_EQ( Status.m_State, m_Model.m_State );
    ASSERT_EQ( Status.m_Failure, m_Model.m_Failure );
    ASSERT_EQ( Status.m_CaptureSessionId.Value(), m_Model.m_Id );
    ASSERT_EQ( ToPosition( Status.m_Start ), m_Model.m_Start );
    ASSERT_EQ( ToPosition( Status.m_End ), m_Model.m_End );
    ASSERT_EQ( ToPosition( Status.m_RequestedStart ), m_Model.m_RequestedStart );
    ASSERT_EQ( ToPosition( Status.m_RequestedEnd ), m_Model.m_RequestedEnd );
    ASSERT_EQ( Status.m_CapturedFrames, m_Model.Captured() );
    ASSERT_EQ( Status.m_AvailableFrames, m_Model.Available() );
    ASSERT_EQ( m_LastToldState, Status.m_State );
    ASSERT_EQ( m_LastToldFailure, Status.m_Failure );
    if( Status.m_CaptureType != CaptureSessionType::Streamed ) return;
    using S = ECaptureState;
    if( Status.m_State & ( S::WaitingForStart | S::Capturing | S::Captured | S::Complete ) )
    {
      ASSERT_TRUE( m_ReadyStart == m_Model.m_Start && m_ReadyEnd == m_Model.m_End );
    }
    if( Status.m_State & ( S::Cancelling | S::Cancelled ) )
    {
      ASSERT_TRUE( m_ReadyStart == VPosition{} && m_ReadyEnd == VPosition{} );
    }
  }

  void CompareClients()
  {
    for( const auto& [Id, pReader] : m_Readers )
    {
      ASSERT_EQ( pReader->m_Notified, pReader->m_bAsleep && m_Model.HasNews( Id ) ? 1 : 0 ) << "client " << Id;
      if( pReader->m_Frame )
      {
        ASSERT_TRUE( NumberedPayload( pReader->m_Frame.Frame() ).Holds( pReader->m_Frame.Token().m_FrameNumber ) );
      }
    }
  }

  std::mt19937 m_Random;
  const std::shared_ptr<TestSupport::VManualPostalService> m_pPostalService = std::make_shared<TestSupport::VManualPostalService>();
  TestSupport::VFrameMemory m_Memory;
  VCaptureBufferModel m_Model;
  const std::shared_ptr<TestSupport::VNumberedCaptureBuffer> m_pBuffer;
  std::map<uint32_t, std::shared_ptr<VReader>> m_Readers;
  std::vector<VPin> m_Pins;
  std::vector<VToken> m_OldTokens;
  size_t m_Added = 0;
  size_t m_NewData = 0;
  std::vector<uint32_t> m_Removed;
  ECaptureState::Enum m_LastToldState = ECaptureState::Idle;
  uint32_t m_LastToldFailure = 0;
  VPosition m_ReadyStart, m_ReadyEnd;
};

void RunScenario( const VScenario& i_rScenario )
{
  SCOPED_TRACE( i_rScenario.m_Seed );
  VRandomRun Run( i_rScenario );
  for( int Step = 0; Step < i_rScenario.m_Steps && !testing::Test::HasFatalFailure(); ++Step )
  {
    SCOPED_TRACE( Step );
    Run.Step();
  }
}

TEST( CaptureBufferModel, ManyShortRuns )
{
  for( unsigned Seed = 1; Seed <= 600 && !HasFatalFailure(); ++Seed ) RunScenario( { Seed, 1 + Seed % 13, 1 + Seed % 5, 150 } );
}

TEST( CaptureBufferModel, LongRuns )
{
  for( unsigned Seed = 1; Seed <= 6 && !HasFatalFailure(); ++Seed ) RunScenario( { 1000 + Seed, 4 * Seed, 1 + Seed % 4, 6000 } );
}

}
