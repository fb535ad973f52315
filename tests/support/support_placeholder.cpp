// Placeholder until shared test helpers land.
