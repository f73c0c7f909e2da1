import QtQuick

// What is wrong with a camera, gravest first. Compact, it is one line with the gravest alone, or a dot where even that
// has no room. Nothing is shown of a camera that nothing is known of.
Column {
    id: root

    property var additionalData: ({})
    property bool loaderCompact: false
    property real availableWidth: 0
    property real availableHeight: 0
    readonly property int lineHeight: 18
    readonly property var warnings: collect(additionalData || {})
    readonly property bool complete: warnings.length === lines.count && !dotsOnly
    readonly property bool dotsOnly: warnings.length > 0 && metrics.width + 26 > availableWidth
    readonly property int fitting: Math.max(1, Math.floor(availableHeight / lineHeight))

    readonly property color grave: "#E5574B"
    readonly property color serious: "#EBB04A"
    readonly property color calm: "#A0A4AA"

    function stateOf(data) {
        if (data.isMissing)
            return { text: qsTr("Camera is missing."), color: grave }
        if (!data.isConnected)
            return { text: qsTr("Camera is disconnected."), color: grave }
        if (!data.isEnabled)
            return { text: qsTr("Camera is disabled."), color: calm }
        if (!data.isContributing)
            return { text: qsTr("Camera is not contributing."), color: serious }
        if (!data.isCalibrated)
            return { text: qsTr("Camera is uncalibrated."), color: serious }
        return null
    }

    function collect(data) {
        if (data.isConnected === undefined)
            return []
        const state = stateOf(data)
        const found = state ? [state] : []
        if (data.isBumped)
            found.push({ text: qsTr("Camera was bumped."), color: grave })
        if (!data.isCurrentTemperatureConsistentWithCalibration)
            found.push({ text: qsTr("Temperature differs from calibration."), color: serious })
        if (!data.wasTemperatureConsistentDuringCalibration)
            found.push({ text: qsTr("Temperature changed during calibration."), color: serious })
        if (data.sensorMode && (data.sensorMode.includes("Bin") || data.sensorMode.includes("Subsample")))
            found.push({ text: qsTr("Reduced resolution: %1").arg(data.sensorMode), color: calm })
        const texts = ["incompatibleVideoStandardWarningText", "videoFramesLostWarningText",
                       "timecodeErrorWarningText", "badSyncWarningText", "notReceivingTriggersText",
                       "linkSpeedTooLowText", "driverVersionText", "ipSettingsText"]
        for (const key of texts) {
            if (data[key])
                found.push({ text: data[key], color: serious })
        }
        return found
    }

    TextMetrics {
        id: metrics

        font.pixelSize: 12
        text: root.warnings.length > 0 ? root.warnings[0].text : ""
    }

    Repeater {
        id: lines

        model: root.loaderCompact || root.dotsOnly ? root.warnings.slice(0, 1)
                                                   : root.warnings.slice(0, root.fitting)

        Rectangle {
            id: line

            required property var modelData

            width: root.dotsOnly ? 12 : Math.min(label.implicitWidth + 26, root.availableWidth)
            height: root.dotsOnly ? 12 : root.lineHeight
            radius: height / 2
            color: "#A0101214"

            Rectangle {
                x: root.dotsOnly ? 2 : 6
                anchors.verticalCenter: parent.verticalCenter
                width: 8
                height: 8
                radius: 4
                color: line.modelData.color
            }

            Text {
                id: label

                x: 19
                width: Math.min(implicitWidth, line.width - x - 7)
                anchors.verticalCenter: parent.verticalCenter
                visible: !root.dotsOnly
                elide: Text.ElideRight
                text: line.modelData.text
                textFormat: Text.PlainText
                color: "#DCDEE2"
                font.pixelSize: 12
            }
        }
    }
}
