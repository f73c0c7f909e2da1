#pragma once

#include <QtCore/QVariantMap>

namespace Flow2Graphics
{

class VFlowRenderSubjects;

/// By display record ("LabellingSubject") and kind of subject ("subjects"): the names of those that are there, and how
/// many objects of each kind the last frame showed of them. Thread: any.
QVariantMap ReportSubjects( VFlowRenderSubjects& i_rSubjects );

} // namespace Flow2Graphics
