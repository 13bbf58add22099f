"""The fault laboratory: what is done to the daemon, and whether both sides still hold the same items, once each."""
