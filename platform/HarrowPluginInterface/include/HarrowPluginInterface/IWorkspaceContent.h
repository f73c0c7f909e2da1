#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <ZEK/Result.h>

#include <QtCore/QPointer>
#include <QtWidgets/QWidget>

#include <memory>
#include <string>

namespace HarrowPluginInterface
{

/// Writes the state of a window into a layout.
class IStateWriter
{
public:
  virtual ~IStateWriter() = default;
  virtual void BeginGroup( const QString& i_rName ) = 0;
  virtual void EndGroup() = 0;
  /// A number, a bool, a text or a list of texts.
  virtual void Write( const QString& i_rName, const QVariant& i_rValue ) = 0;
};

/// Reads the state of a window from a layout.
class IStateReader
{
public:
  virtual ~IStateReader() = default;
  virtual bool Has( const QString& i_rName ) const = 0;
  /// `NotFound` for a missing entry, `InvalidType` for one of another type; `o_rValue` is then untouched.
  virtual ZEK::IResult Read( const QString& i_rName, QMetaType i_Type, QVariant& o_rValue ) const = 0;
  /// The group of that name; null when there is none.
  virtual std::unique_ptr< IStateReader > Child( const QString& i_rName ) const = 0;
};

class IHarrowWindowPersist
{
public:
  virtual void SaveState( IStateWriter& io_rWriter, const QString& i_rPrefix ) = 0;
  virtual void RestoreState( const IStateReader& i_rReader, const QString& i_rPrefix ) = 0;
  virtual ~IHarrowWindowPersist() = default;
};

class IHarrowExecuteCommand
{
public:
  virtual ~IHarrowExecuteCommand() = default;
  /// Whether the text was a command of this window and could be carried out.
  virtual bool ExecuteCommand( const std::string& i_rText ) = 0;
};

/// The widget that a window shows; the host places it. Content may also be an IHarrowWindowPersist and an
/// IHarrowExecuteCommand, found by dynamic_cast.
class VWindowFrameContent : public QWidget
{
public:
  using QWidget::QWidget;
};

/// Makes the content of one window kind.
class IWorkspaceContentFactory
{
public:
  virtual ~IWorkspaceContentFactory() = default;
  /// Fills `toolbar`'s layout with the window's tools; the content is deleted with the last reference.
  virtual void Create( std::shared_ptr< VWindowFrameContent >& o_rpContent,
                       const std::shared_ptr< IStateCacheContext >& i_rpContext,
                       const QPointer< QWidget >& i_rpToolbar ) = 0;
};

/// The list of window kinds.
class IContentFactories
{
public:
  virtual ~IContentFactories() = default;
  virtual std::vector< std::string > Names() const = 0;
  virtual void AddFactory( const std::string& i_rName, std::shared_ptr< IWorkspaceContentFactory > i_pFactory ) = 0;
};

} // namespace HarrowPluginInterface
