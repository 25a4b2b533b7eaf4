// Points the engine's readers of preferences at the resource objects of the settings.
#pragma once

// Called once the resource settings have been read (start-up step 7).
void wireSettingsIntoEngine();
