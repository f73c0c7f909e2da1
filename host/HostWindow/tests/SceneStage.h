#pragma once

#include <HostWindow/Session.h>
#include <HostWindow/ViewDriver.h>

#include <HarrowPluginInterface/IWorkspaceContent.h>
#include <TestSupport/Paths.h>

#include <QtGui/QImage>
#include <QtWidgets/QHBoxLayout>

#include <gtest/gtest.h>

/// Views of the real module that stand still at a moment of the simulated capture, for many pictures in a row.
class VSceneStage
{
public:
  VSceneStage( const HostWindow::VCommonOptions& i_rOptions, double i_Seconds )
  {
    qputenv( "XDG_CONFIG_HOME", m_Folder.Path().c_str() );
    qputenv( "XDG_DATA_HOME", m_Folder.Path().c_str() );
    m_pSession = std::make_unique< HostWindow::VSession >( i_rOptions );
    m_Wrong = m_pSession->StartPlugin();
    m_pSession->SetSeen( false );
    m_pSession->GoLive();
    std::int64_t Index = 0;
    EXPECT_TRUE( m_pSession->ShowStill( i_Seconds, Index ).IsOk() );
    m_pToolbar->setLayout( new QHBoxLayout );
  }

  /// Shows a window of another kind in place of the one before.
  void Open( const std::string& i_rKind, QSize i_Size )
  {
    m_pDriver.reset();
    m_pContent.reset();
    const auto pFactory = m_pSession->Host().Factories()->Find( m_pSession->FindWindowKind( i_rKind ) );
    if ( !m_Wrong.empty() || !pFactory )
    {
      m_Wrong += " no such window";
      return;
    }
    pFactory->Create( m_pContent, m_pSession->Context(), QPointer< QWidget >( m_pToolbar.get() ) );
    m_pContent->resize( i_Size );
    m_pContent->show();
    HostWindow::VSceneView View( m_pContent.get() );
    View.SetReporting( true );
    m_pDriver = std::make_unique< HostWindow::VViewDriver >( View, m_pSession->Host().Selection() );
    if ( !View.Item() || !m_pDriver->WaitFrames( 4 ) )
    {
      m_Wrong = "the view draws nothing";
    }
  }
  /// Empty when the view draws.
  const std::string& Wrong() const { return m_Wrong; }
  HostWindow::VSession& Session() { return *m_pSession; }
  HostWindow::VSceneView& View() { return m_pDriver->View(); }
  /// Holds from the next frame on.
  void Set( const QString& i_rKey, bool i_bOn )
  {
    EXPECT_TRUE( View().SetOption( i_rKey, i_bOn ) ) << i_rKey.toStdString();
  }
  void Settle() { EXPECT_TRUE( m_pDriver->WaitFrames( 2 ) ); }
  QImage Picture()
  {
    Settle();
    return View().Widget()->grabFramebuffer().convertToFormat( QImage::Format_RGB32 );
  }
  template < class TAction >
  void Do( const TAction& i_rAction, Qt::KeyboardModifiers i_Modifiers = Qt::NoModifier )
  {
    HostWindow::VViewAction Action;
    Action.What = i_rAction;
    Action.Modifiers = i_Modifiers;
    EXPECT_EQ( m_pDriver->Perform( Action ).toStdString(), "" );
  }
  void Select( const std::string& i_rItem ) { Do( HostWindow::VSelectAction{ i_rItem } ); }
  void Wheel( int i_Notches )
  {
    const QPointF Middle( m_pContent->width() / 2.0, m_pContent->height() / 2.0 );
    for ( int Notch = 0; Notch < i_Notches; ++Notch )
    {
      Do( HostWindow::VWheelAction{ Middle, 120 } );
    }
  }
  ZEK::VSelection Selected() { return m_pSession->Host().Selection()->Get( ZEK::ISelectionService::EPrimary ); }

private:
  TestSupport::VTemporaryDir m_Folder;
  std::unique_ptr< HostWindow::VSession > m_pSession;
  std::unique_ptr< QWidget > m_pToolbar = std::make_unique< QWidget >();
  std::shared_ptr< HarrowPluginInterface::VWindowFrameContent > m_pContent;
  std::unique_ptr< HostWindow::VViewDriver > m_pDriver;
  std::string m_Wrong;
};

/// The pixels in which two pictures differ.
class VMask
{
public:
  VMask( const QImage& i_rA, const QImage& i_rB )
    : m_Size( i_rA.size() )
    , m_Bits( static_cast< std::size_t >( i_rA.width() ) * i_rA.height() )
  {
    EXPECT_EQ( i_rA.size(), i_rB.size() );
    for ( int Y = 0; Y < m_Size.height(); ++Y )
    {
      for ( int X = 0; X < m_Size.width(); ++X )
      {
        m_Bits[Index( X, Y )] = i_rA.pixel( X, Y ) != i_rB.pixel( X, Y );
      }
    }
  }
  QSize Size() const { return m_Size; }
  bool At( int i_X, int i_Y ) const
  {
    return i_X >= 0 && i_Y >= 0 && i_X < m_Size.width() && i_Y < m_Size.height() && m_Bits[Index( i_X, i_Y )];
  }
  /// How many pixels of `i_Reach` to each side of a place differ.
  int Around( QPoint i_At, int i_Reach ) const
  {
    int Count = 0;
    for ( int Y = -i_Reach; Y <= i_Reach; ++Y )
    {
      for ( int X = -i_Reach; X <= i_Reach; ++X )
      {
        Count += At( i_At.x() + X, i_At.y() + Y ) ? 1 : 0;
      }
    }
    return Count;
  }
  /// The pixel with the most of its kind around it, so far away from those of other masks.
  QPoint Deepest( const std::vector< const VMask* >& i_rOthers, int i_Away ) const
  {
    const std::vector< QPoint > Found = DeepestApart( i_rOthers, i_Away, 1, 0 );
    return Found.empty() ? QPoint( -1, -1 ) : Found[0];
  }
  /// Several of them, so far apart from each other.
  std::vector< QPoint > DeepestApart( const std::vector< const VMask* >& i_rOthers, int i_Away, std::size_t i_Count,
                                      int i_Apart ) const
  {
    std::vector< std::pair< int, QPoint > > All;
    for ( int Y = 0; Y < m_Size.height(); ++Y )
    {
      for ( int X = 0; X < m_Size.width(); ++X )
      {
        const auto IsClear = [&]( const VMask* i_pOther )
        {
          return i_pOther->Around( { X, Y }, i_Away ) == 0;
        };
        if ( At( X, Y ) && std::all_of( i_rOthers.begin(), i_rOthers.end(), IsClear ) )
        {
          All.push_back( { -Around( { X, Y }, 3 ), { X, Y } } );
        }
      }
    }
    std::stable_sort( All.begin(), All.end(),
                      []( const auto& i_rA, const auto& i_rB )
                      {
                        return i_rA.first < i_rB.first;
                      } );
    std::vector< QPoint > Found;
    for ( const auto& [Depth, Place] : All )
    {
      const auto IsApart = [&, Here = Place]( QPoint i_Other )
      {
        return ( i_Other - Here ).manhattanLength() > i_Apart;
      };
      if ( Found.size() < i_Count && std::all_of( Found.begin(), Found.end(), IsApart ) )
      {
        Found.push_back( Place );
      }
    }
    return Found;
  }

private:
  std::size_t Index( int i_X, int i_Y ) const { return static_cast< std::size_t >( i_Y ) * m_Size.width() + i_X; }

  QSize m_Size;
  std::vector< bool > m_Bits;
};
