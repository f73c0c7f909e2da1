#include <HostServices/VCommandRegistry.h>
#include <HostServices/VContentFactories.h>
#include <HostServices/VRenderResources.h>
#include <HostServices/VUndoStack.h>

#include <ZEK/Log.h>

#include <QtGui/QUndoCommand>

#include <algorithm>

namespace HostServices
{
namespace
{
ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Workspace" );
  return rCategory;
}

/// Replaces the entry of the same name, or appends. The old one goes last: what its callback holds may come back here.
template < typename T >
void Put( std::vector< T >& io_rEntries, T i_Entry )
{
  const auto Known = std::find_if( io_rEntries.begin(), io_rEntries.end(),
                                   [Name = i_Entry.Name()]( const T& i_rOther )
                                   {
                                     return i_rOther.Name() == Name;
                                   } );
  if ( Known == io_rEntries.end() )
  {
    io_rEntries.push_back( std::move( i_Entry ) );
  }
  else
  {
    std::swap( *Known, i_Entry );
  }
}

template < typename T >
std::function< void() > FindCallback( const std::vector< T >& i_rEntries, const QString& i_rName )
{
  for ( const T& rEntry : i_rEntries )
  {
    if ( rEntry.Name() == i_rName )
    {
      return rEntry.Callback;
    }
  }
  return {};
}

QString WithoutMnemonic( const QString& i_rText )
{
  QString Text;
  for ( qsizetype At = 0; At < i_rText.size(); ++At )
  {
    // A doubled sign stands for itself.
    const bool bSign = i_rText[At] == QLatin1Char( '&' ) && At + 1 < i_rText.size();
    Text += i_rText[bSign ? ++At : At];
  }
  return Text;
}
} // namespace

QString VMenuAction::Name() const
{
  QStringList Words;
  for ( const QString& rWord : Path )
  {
    Words << WithoutMnemonic( rWord );
  }
  return Words.join( QLatin1Char( '/' ) );
}

class VCommandRegistry::VKeyed final : public HarrowPluginInterface::IKeyedCommands
{
public:
  void AddCommand( const QString& i_rGroup, const QString& i_rText, std::function< void() > i_Callback,
                   const QString& i_rDefaultKey ) override
  {
    if ( i_rText.isEmpty() || !i_Callback )
    {
      ZEK::Log( Category(), ZEK::ELogWarning, "Command %1% of group %2% has no text or no callback",
                i_rText.toStdString(), i_rGroup.toStdString() );
      return;
    }
    Put( Commands, VKeyedCommand{ i_rGroup, i_rText, i_rDefaultKey, std::move( i_Callback ) } );
    Changed.Fire();
  }

  std::vector< VKeyedCommand > Commands;
  ZEK::VMultiCallback< void() > Changed;
};

VCommandRegistry::VCommandRegistry()
  : m_pKeyed( std::make_shared< VKeyed >() )
{
}

VCommandRegistry::~VCommandRegistry() = default;

void VCommandRegistry::AddAction( const std::vector< QString >& i_rMenuPath, std::function< void() > i_Callback,
                                  const std::vector< QString >& i_rIcons, const QString& i_rToolTip )
{
  if ( i_rMenuPath.empty() || !i_Callback )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "A menu entry has no path or no callback" );
    return;
  }
  Put( m_Actions, VMenuAction{ i_rMenuPath, i_rIcons, i_rToolTip, std::move( i_Callback ) } );
  m_pKeyed->Changed.Fire();
}

std::shared_ptr< HarrowPluginInterface::IKeyedCommands > VCommandRegistry::KeyedCommands() const
{
  return m_pKeyed;
}

const std::vector< VKeyedCommand >& VCommandRegistry::Commands() const
{
  return m_pKeyed->Commands;
}

ZEK::IMultiCallback< void() >& VCommandRegistry::Changed()
{
  return m_pKeyed->Changed;
}

bool VCommandRegistry::Execute( const QString& i_rName )
{
  // A copy: the callback may change the registry.
  std::function< void() > Callback = FindCallback( m_pKeyed->Commands, i_rName );
  if ( !Callback )
  {
    Callback = FindCallback( m_Actions, i_rName );
  }
  if ( Callback )
  {
    Callback();
  }
  return static_cast< bool >( Callback );
}

QStringList VCommandRegistry::Names() const
{
  QStringList Names;
  for ( const VKeyedCommand& rCommand : m_pKeyed->Commands )
  {
    Names << rCommand.Name();
  }
  for ( const VMenuAction& rAction : m_Actions )
  {
    Names << rAction.Name();
  }
  return Names;
}

void VCommandRegistry::Clear()
{
  // Callbacks go after the registry is empty: what they hold may come back to it.
  const std::vector< VKeyedCommand > Commands = std::exchange( m_pKeyed->Commands, {} );
  const std::vector< VMenuAction > Actions = std::exchange( m_Actions, {} );
  if ( !Commands.empty() || !Actions.empty() )
  {
    m_pKeyed->Changed.Fire();
  }
}

std::vector< std::string > VContentFactories::Names() const
{
  std::vector< std::string > Names;
  for ( const auto& rEntry : m_Factories )
  {
    Names.push_back( rEntry.first );
  }
  return Names;
}

void VContentFactories::AddFactory( const std::string& i_rName, std::shared_ptr< VFactory > i_pFactory )
{
  if ( !i_pFactory )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Window kind %1% has no factory", i_rName );
    return;
  }
  const auto Known = std::find_if( m_Factories.begin(), m_Factories.end(),
                                   [&]( const auto& i_rEntry )
                                   {
                                     return i_rEntry.first == i_rName;
                                   } );
  if ( Known == m_Factories.end() )
  {
    m_Factories.emplace_back( i_rName, std::move( i_pFactory ) );
  }
  else
  {
    Known->second.swap( i_pFactory );
  }
  m_Changed.Fire();
}

std::shared_ptr< VContentFactories::VFactory > VContentFactories::Find( const std::string& i_rName ) const
{
  for ( const auto& [rName, rpFactory] : m_Factories )
  {
    if ( rName == i_rName )
    {
      return rpFactory;
    }
  }
  return nullptr;
}

void VContentFactories::Clear()
{
  const auto Factories = std::exchange( m_Factories, {} );
  if ( !Factories.empty() )
  {
    m_Changed.Fire();
  }
}

VRenderResources::VRenderResources( std::vector< std::filesystem::path > i_OverrideFolders )
  : m_Folders( std::move( i_OverrideFolders ) )
{
}

std::vector< std::filesystem::path > VRenderResources::OverrideFolders() const
{
  const std::lock_guard Lock( m_Guard );
  return m_Folders;
}

void VRenderResources::SetOverrideFolders( std::vector< std::filesystem::path > i_Folders )
{
  const std::lock_guard Lock( m_Guard );
  m_Folders = std::move( i_Folders );
}

void VRenderResources::Reload()
{
  m_Generation.fetch_add( 1, std::memory_order_acq_rel );
  m_Requested.Fire();
}

namespace
{
constexpr int MergedCommand = 1;

class VFunctionCommand final : public QUndoCommand
{
public:
  VFunctionCommand( const QString& i_rText, std::function< void() > i_Redo, std::function< void() > i_Undo,
                    const QString& i_rMergeKey )
    : QUndoCommand( i_rText )
    , m_Redo( std::move( i_Redo ) )
    , m_Undo( std::move( i_Undo ) )
    , m_MergeKey( i_rMergeKey )
  {
  }

  int id() const override { return m_MergeKey.isEmpty() ? -1 : MergedCommand; }
  bool mergeWith( const QUndoCommand* i_pNewer ) override
  {
    const auto* const pNewer = static_cast< const VFunctionCommand* >( i_pNewer );
    if ( pNewer->m_MergeKey != m_MergeKey )
    {
      return false;
    }
    m_Redo = pNewer->m_Redo;
    return true;
  }
  void redo() override { m_Redo(); }
  void undo() override { m_Undo(); }

private:
  std::function< void() > m_Redo;
  std::function< void() > m_Undo;
  QString m_MergeKey;
};
} // namespace

void VUndoStack::Push( const QString& i_rText, std::function< void() > i_Redo, std::function< void() > i_Undo,
                       const QString& i_rMergeKey )
{
  if ( !i_Redo || !i_Undo )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Step %1% cannot be undone or redone", i_rText.toStdString() );
    return;
  }
  m_Stack.push( new VFunctionCommand( i_rText, std::move( i_Redo ), std::move( i_Undo ), i_rMergeKey ) );
}

} // namespace HostServices
