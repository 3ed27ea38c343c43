"""velmora-fleet: many recorded sessions replayed under one or two configurations."""
