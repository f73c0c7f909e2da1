#pragma once

#include <ZEK/Callback.h>

#include <QtCore/QString>
#include <QtCore/QVariantMap>

namespace MoxelGraphics
{

/// Knows more of a camera than a view needs to draw it: what documents write on its tile. Thread: GUI.
class ICameraModelAdditionalDataSource
{
public:
  virtual ~ICameraModelAdditionalDataSource() = default;
  /// Named values; empty for a device that the source does not know.
  virtual QVariantMap AdditionalData( const QString& i_rURN ) const = 0;
  /// Fires when the answer for any device may be another one.
  virtual ZEK::IMultiCallbackPostal< void() >& Changed() = 0;
};

} // namespace MoxelGraphics
