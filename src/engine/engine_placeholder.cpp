// Placeholder until the room has sources.
