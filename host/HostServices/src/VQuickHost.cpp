#include <HostServices/VQuickHost.h>

#include <ZEK/Log.h>

#include <QtQml/QQmlEngine>
#include <QtQml/QQmlError>

#include <algorithm>
#include <set>

namespace HostServices
{
namespace
{
/// A program that is run for weeks must not collect texts without end.
constexpr std::size_t MaximumTexts = 2000;

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Qml" );
  return rCategory;
}
} // namespace

struct VQuickHost::VState
{
  void Report( const QList< QQmlError >& i_rWarnings )
  {
    for ( const QQmlError& rWarning : i_rWarnings )
    {
      std::string Text = rWarning.toString().toStdString();
      if ( Seen.size() < MaximumTexts && Seen.insert( Text ).second )
      {
        ZEK::Log( Category(), ZEK::ELogWarning, "%1%", Text );
      }
    }
  }

  std::set< std::string > Seen;
  std::unique_ptr< QQmlEngine > pEngine;
};

VQuickHost::VQuickHost()
  : m_pState( std::make_unique< VState >() )
  , m_Colours{ QColor( 0x2b, 0x2d, 0x31 ), QColor( 0xd8, 0xda, 0xde ), QColor( 0x5b, 0x9b, 0xd5 ),
               QColor( 0x3a, 0x6e, 0xa5 ) }
{
  m_pState->pEngine = std::make_unique< QQmlEngine >();
  m_pState->pEngine->setOutputWarningsToStandardError( false );
  QObject::connect( m_pState->pEngine.get(), &QQmlEngine::warnings, m_pState->pEngine.get(),
                    [pState = m_pState.get()]( const QList< QQmlError >& i_rWarnings )
                    {
                      pState->Report( i_rWarnings );
                    } );
}

VQuickHost::~VQuickHost() = default;

QQmlEngine* VQuickHost::Engine() const
{
  return m_pState->pEngine.get();
}

QColor VQuickHost::ThemeColour( EThemeColour i_Colour ) const
{
  return m_Colours[std::clamp< int >( i_Colour, EThemeWindow, EThemePrimary )];
}

void VQuickHost::SetThemeColour( EThemeColour i_Colour, const QColor& i_rValue )
{
  QColor& rColour = m_Colours[std::clamp< int >( i_Colour, EThemeWindow, EThemePrimary )];
  if ( rColour != i_rValue )
  {
    rColour = i_rValue;
    m_ThemeChanged.Fire();
  }
}

QPalette VQuickHost::Palette() const
{
  const QColor Window = m_Colours[EThemeWindow];
  const QColor Text = m_Colours[EThemeText];
  QPalette Palette( Window.lighter( 125 ), Window );
  for ( const auto Role : { QPalette::WindowText, QPalette::Text, QPalette::ButtonText, QPalette::ToolTipText } )
  {
    Palette.setColor( Role, Text );
    Palette.setColor( QPalette::Disabled, Role, Text.darker( 190 ) );
  }
  Palette.setColor( QPalette::Base, Window.darker( 125 ) );
  Palette.setColor( QPalette::AlternateBase, Window.darker( 112 ) );
  Palette.setColor( QPalette::ToolTipBase, Window.darker( 140 ) );
  Palette.setColor( QPalette::PlaceholderText, Text.darker( 160 ) );
  Palette.setColor( QPalette::Highlight, m_Colours[EThemePrimary] );
  Palette.setColor( QPalette::HighlightedText, Qt::white );
  Palette.setColor( QPalette::Link, m_Colours[EThemeAccent] );
  return Palette;
}

void VQuickHost::Shutdown()
{
  m_pState->pEngine.reset();
}

} // namespace HostServices
