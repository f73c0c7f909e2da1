#pragma once

#include <ZEK/Export.h>

#include <QtCore/QObject>
#include <QtCore/QString>

namespace ZEK::IO
{

/// The QML singleton "Result" of module Moxel.Types 1.0: questions about a numeric result code.
class ZEK_API VResultNamespaceObjectQml : public QObject
{
  Q_OBJECT

public:
  using QObject::QObject;

  Q_INVOKABLE bool isOk( quint32 i_Code ) const;
  Q_INVOKABLE bool isError( quint32 i_Code ) const;
  Q_INVOKABLE QString description( quint32 i_Code ) const;
  /// The code of a name such as "NotFound"; the code of `Failed` for a name that does not exist.
  Q_INVOKABLE quint32 code( const QString& i_rName ) const;
  /// 0 for a success, 1 for a failure.
  Q_INVOKABLE int category( quint32 i_Code ) const;
};

/// Publishes the singleton. Registers once per process, however often it is called.
ZEK_API void RegisterResultQml();

} // namespace ZEK::IO
