#pragma once

#include <QSize>
#include <QString>
#include <filesystem>
#include <optional>

/// What the command line asks of the application.
struct QVApplicationOptions {
    /// A store of its own with prepared records relative to today, rebuilt once a day.
    bool demo = false;
    /// Draw every tab and time scope into PNG files in this folder and end; works without a display.
    std::optional<std::filesystem::path> screenshots;
    /// The window's size in points; not valid: that of a phone, 375 x 667.
    QSize size;
    /// Pixels per point of the screenshots; 0: the system's.
    double scale = 0;
    /// How large texts are, from 1 to 3; 0: as the person's desktop says.
    double textScale = 0;
    /// Whether the contrast is high; none: as the person's desktop says.
    std::optional<bool> highContrast;
    /// A link of the application, "qelvar://DashboardTab"; empty: none.
    QString openLink;
    /// The store's folder; empty: QVStoreFolder(demo). It also holds the local user defaults.
    std::filesystem::path store;
};

/// The user's store: $XDG_DATA_HOME/qelvar (~/.local/share/qelvar), or qelvar-demo beside it. Not made here.
std::filesystem::path QVStoreFolder(bool demo);

/// Runs the application until its window is closed (or the screenshots are written) and returns the exit
/// status: 0, or 1 with a message on standard error when the store cannot be opened or a picture not be
/// written. The environment (clock, zone, locale) must be installed before. Makes the QGuiApplication: call
/// it once, on the main thread.
int QVRunApplication(int argc, char** argv, const QVApplicationOptions& options);
